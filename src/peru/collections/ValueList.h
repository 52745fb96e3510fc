// The table of values by name.
#pragma once

#include "peru/Object.h"
#include "peru/collections/IValueList.h"
#include "peru/collections/SimpleHashTable.h"

#include <vector>

namespace peru {

class PERU_API CValueList : public CObject, public IValueList {
public:
    class CNameEnum;

    CValueList();
    ~CValueList() override;

    void setValue(const CStringArg& name, const P<IBase>& value) override;
    P<IBase> getValue(const CStringArg& name) const override;
    bool hasValue(const CStringArg& name) const override;
    void removeValue(const CStringArg& name) override;
    void clear() override;
    int32_t getCount() const override;
    WEnum<IString> getNames() const override;

private:
    struct SEntry {
        P<IBase> value;
    };

    TSimpleHashTable<P<IString>, SEntry> m_entries;
};

// Enumerates the names that the list had when the enumerator was created.
class PERU_API CValueList::CNameEnum : public CObject, public IEnum {
public:
    explicit CNameEnum(const CValueList& list);
    ~CNameEnum() override;

    bool hasMore() const override { return m_next < m_names.size(); }
    int32_t getCount() const override { return static_cast<int32_t>(m_names.size()); }
    PC<IBase> getNextConst() override { return getNext(); }
    P<IBase> getNext() override;
    void reset() override { m_next = 0; }

private:
    std::vector<P<IString>> m_names;
    size_t m_next = 0;
};

} // namespace peru
