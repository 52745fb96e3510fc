// The table of localised texts.
#pragma once

#include "peru/collections/SimpleHashTable.h"
#include "peru/strings/IStringLocalizer.h"

#include <mutex>
#include <shared_mutex>

namespace peru {

// Any number of threads look up texts at the same time; a look-up allocates nothing. Asks its parent with its
// own mutex held: the lock order is child, then parent.
class PERU_API CStringLocalizer : public CObject, public IStringLocalizer {
public:
    CStringLocalizer();
    ~CStringLocalizer() override;

    void clear() override;
    // Parents must not form a cycle; the localizer itself as its parent throws CInvalidArgError.
    void setParent(const P<IStringLocalizer>& parent) override;
    void setText(const CStringArg& key, const P<IString>& text) override;
    P<IString> getText(const CStringArg& key, const P<IString>& defaultText) override;
    P<IString> findText(const CStringArg& key) override;

private:
    // Null if there is no entry or an empty one. Needs the lock.
    const P<IString>* findOwn(const CStringArg& key) const;

    std::shared_mutex m_mutex; // guards the members below
    TSimpleHashTable<P<IString>, P<IString>> m_texts;
    P<IStringLocalizer> m_parent;
};

} // namespace peru
