#include "peru/collections/ValueList.h"

#include "peru/Errors.h"

namespace peru {

namespace {

// Wraps a name as a string object for a look-up, without copying its bytes.
class CWantedName : public CString {
public:
    explicit CWantedName(const CStringArg& name) : CString(name.getView(), false) {}
};

} // namespace

CValueList::CValueList() = default;

CValueList::~CValueList() = default;

void CValueList::setValue(const CStringArg& name, const P<IBase>& value) {
    m_entries.set(CString::fromView(name.getView()), SEntry{value});
}

P<IBase> CValueList::getValue(const CStringArg& name) const {
    const SEntry* entry = m_entries.find(CWantedName(name));
    return entry ? entry->value : nullptr;
}

bool CValueList::hasValue(const CStringArg& name) const {
    return m_entries.find(CWantedName(name)) != nullptr;
}

void CValueList::removeValue(const CStringArg& name) {
    m_entries.remove(CWantedName(name));
}

void CValueList::clear() {
    m_entries.clear();
}

int32_t CValueList::getCount() const {
    return static_cast<int32_t>(m_entries.getCount());
}

WEnum<IString> CValueList::getNames() const {
    return P<IEnum>(make<CNameEnum>(*this));
}

CValueList::CNameEnum::CNameEnum(const CValueList& list) {
    m_names.reserve(list.m_entries.getCount());
    list.m_entries.forEach([&](const P<IString>& name, const SEntry&) { m_names.push_back(name); });
}

CValueList::CNameEnum::~CNameEnum() = default;

P<IBase> CValueList::CNameEnum::getNext() {
    if (!hasMore()) throw CEndOfEnumError(P<CNameEnum>::share(this));
    return m_names[m_next++];
}

} // namespace peru
