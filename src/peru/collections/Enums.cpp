#include "peru/collections/Enums.h"

#include "peru/Errors.h"

#include <algorithm>
#include <utility>

namespace peru {

namespace {

// The first enumerator of the chain that has more elements, or null.
template <class E> E* findCurrent(const std::vector<P<E>>& enums) {
    auto found = std::find_if(enums.begin(), enums.end(), [](const P<E>& e) { return e && e->hasMore(); });
    return found == enums.end() ? nullptr : found->get();
}

template <class E> E& requireCurrent(const std::vector<P<E>>& enums, CObject* chain) {
    if (E* current = findCurrent(enums)) return *current;
    throw CEndOfEnumError(P<IBase>::share(chain));
}

template <class E> int32_t sumCounts(const std::vector<P<E>>& enums) {
    int32_t sum = 0;
    for (const P<E>& each : enums) sum += each ? each->getCount() : 0;
    return sum;
}

template <class E> void resetAll(const std::vector<P<E>>& enums) {
    for (const P<E>& each : enums)
        if (each) each->reset();
}

} // namespace

void throwEndOfEnum() {
    throw CEndOfEnumError();
}

CEmptyEnum::CEmptyEnum() = default;

CEmptyEnum::~CEmptyEnum() = default;

bool CEmptyEnum::hasMore() const {
    return false;
}

int32_t CEmptyEnum::getCount() const {
    return 0;
}

PC<IBase> CEmptyEnum::getNextConst() {
    return getNext();
}

P<IBase> CEmptyEnum::getNext() {
    throw CEndOfEnumError(P<IBase>(P<CEmptyEnum>::share(this)));
}

void CEmptyEnum::reset() {}

CMultiEnum::CMultiEnum(std::vector<P<IEnum>> enums) : m_enums(std::move(enums)) {}

CMultiEnum::~CMultiEnum() = default;

void CMultiEnum::addEnum(const P<IEnum>& elements) {
    m_enums.push_back(elements);
}

bool CMultiEnum::hasMore() const {
    return findCurrent(m_enums) != nullptr;
}

int32_t CMultiEnum::getCount() const {
    return sumCounts(m_enums);
}

PC<IBase> CMultiEnum::getNextConst() {
    return requireCurrent(m_enums, this).getNextConst();
}

P<IBase> CMultiEnum::getNext() {
    return requireCurrent(m_enums, this).getNext();
}

void CMultiEnum::reset() {
    resetAll(m_enums);
}

CConstMultiEnum::CConstMultiEnum(std::vector<P<IConstEnum>> enums) : m_enums(std::move(enums)) {}

CConstMultiEnum::~CConstMultiEnum() = default;

void CConstMultiEnum::addEnum(const P<IConstEnum>& elements) {
    m_enums.push_back(elements);
}

bool CConstMultiEnum::hasMore() const {
    return findCurrent(m_enums) != nullptr;
}

int32_t CConstMultiEnum::getCount() const {
    return sumCounts(m_enums);
}

PC<IBase> CConstMultiEnum::getNextConst() {
    return requireCurrent(m_enums, this).getNextConst();
}

void CConstMultiEnum::reset() {
    resetAll(m_enums);
}

} // namespace peru
