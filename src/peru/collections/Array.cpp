#include "peru/collections/Array.h"

#include "peru/Errors.h"

#include <algorithm>
#include <string>
#include <utility>

namespace peru {

namespace {

// `end` is the first invalid index.
void checkIndex(int32_t index, size_t end, const char* method, const CObject* array) {
    if (index >= 0 && static_cast<size_t>(index) < end) return;
    throw CInvalidArgError(("index " + std::to_string(index)).c_str(), method,
                           P<IBase>::share(const_cast<CObject*>(array)));
}

int32_t getStart(const IConstArray& array, bool backwards) {
    return backwards ? array.getCount() - 1 : 0;
}

bool isInside(const IConstArray& array, int32_t index) {
    return index >= 0 && index < array.getCount();
}

// Returns the current index and advances it; throws past the end.
int32_t step(const IConstArray& array, int32_t& index, bool backwards, CObject* enumerator) {
    if (!isInside(array, index)) throw CEndOfEnumError(P<IBase>::share(enumerator));
    return backwards ? index-- : index++;
}

} // namespace

CConstArray::CConstArray(std::vector<PC<IBase>> elements) : m_elements(std::move(elements)) {}

CConstArray::~CConstArray() = default;

int32_t CConstArray::getCount() const {
    return static_cast<int32_t>(m_elements.size());
}

PC<IBase> CConstArray::getConstAt(int32_t index) const {
    checkIndex(index, m_elements.size(), "getConstAt", this);
    return m_elements[static_cast<size_t>(index)];
}

P<IConstEnum> CConstArray::createConstEnum(bool backwards) const {
    return make<CArray::CConstEnum>(PC<IConstArray>::share(this), backwards);
}

CArray::CArray() = default;

CArray::~CArray() = default;

int32_t CArray::getCount() const {
    return static_cast<int32_t>(m_elements.size());
}

PC<IBase> CArray::getConstAt(int32_t index) const {
    checkIndex(index, m_elements.size(), "getConstAt", this);
    return m_elements[static_cast<size_t>(index)];
}

P<IConstEnum> CArray::createConstEnum(bool backwards) const {
    return make<CConstEnum>(PC<IConstArray>::share(this), backwards);
}

P<IBase> CArray::getAt(int32_t index) const {
    checkIndex(index, m_elements.size(), "getAt", this);
    return m_elements[static_cast<size_t>(index)];
}

P<IEnum> CArray::createEnum(bool backwards) {
    return make<CEnum>(P<IArray>::share(this), backwards);
}

void CArray::add(const P<IBase>& element) {
    m_elements.push_back(element);
}

void CArray::insertAt(int32_t index, const P<IBase>& element) {
    checkIndex(index, m_elements.size() + 1, "insertAt", this);
    m_elements.insert(m_elements.begin() + index, element);
}

void CArray::setAt(int32_t index, const P<IBase>& element) {
    checkIndex(index, m_elements.size(), "setAt", this);
    // The old element is destroyed after it has been replaced, since its destructor may use this array.
    P<IBase> replaced = std::exchange(m_elements[static_cast<size_t>(index)], element);
}

void CArray::removeAt(int32_t index) {
    checkIndex(index, m_elements.size(), "removeAt", this);
    P<IBase> removed = std::move(m_elements[static_cast<size_t>(index)]);
    m_elements.erase(m_elements.begin() + index);
}

bool CArray::remove(const P<IBase>& element) {
    auto found = std::find(m_elements.begin(), m_elements.end(), element);
    if (found == m_elements.end()) return false;
    removeAt(static_cast<int32_t>(found - m_elements.begin()));
    return true;
}

void CArray::clear() {
    std::vector<P<IBase>> removed;
    removed.swap(m_elements);
}

CArray::CConstEnum::CConstEnum(const PC<IConstArray>& array, bool backwards)
    : m_array(array), m_backwards(backwards) {
    reset();
}

CArray::CConstEnum::~CConstEnum() = default;

bool CArray::CConstEnum::hasMore() const {
    return isInside(*m_array, m_index);
}

int32_t CArray::CConstEnum::getCount() const {
    return m_array->getCount();
}

PC<IBase> CArray::CConstEnum::getNextConst() {
    return m_array->getConstAt(step(*m_array, m_index, m_backwards, this));
}

void CArray::CConstEnum::reset() {
    m_index = getStart(*m_array, m_backwards);
}

CArray::CEnum::CEnum(const P<IArray>& array, bool backwards) : m_array(array), m_backwards(backwards) {
    reset();
}

CArray::CEnum::~CEnum() = default;

bool CArray::CEnum::hasMore() const {
    return isInside(*m_array, m_index);
}

int32_t CArray::CEnum::getCount() const {
    return m_array->getCount();
}

PC<IBase> CArray::CEnum::getNextConst() {
    return getNext();
}

P<IBase> CArray::CEnum::getNext() {
    return m_array->getAt(step(*m_array, m_index, m_backwards, this));
}

void CArray::CEnum::reset() {
    m_index = getStart(*m_array, m_backwards);
}

} // namespace peru
