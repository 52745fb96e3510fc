// A candidate of a query.
#pragma once

#include "peru/Object.h"
#include "peru/strings/IString.h"

namespace freedb {

using peru::P;

// Immutable.
class CFreeDBDiscDesc : public peru::CObject {
public:
    CFreeDBDiscDesc(const P<peru::IString>& category, uint32_t discId, const P<peru::IString>& title)
        : m_category(category), m_discId(discId), m_title(title) {}
    ~CFreeDBDiscDesc() override = default;

    const P<peru::IString>& getCategory() const { return m_category; }
    uint32_t getDiscId() const { return m_discId; } // of the record, which need not be that of the query
    const P<peru::IString>& getTitle() const { return m_title; } // usually artist and album

private:
    P<peru::IString> m_category;
    uint32_t m_discId;
    P<peru::IString> m_title;
};

} // namespace freedb
