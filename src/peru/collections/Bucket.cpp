#include "peru/collections/Bucket.h"

namespace peru {

namespace {

template <class Map> std::vector<P<IString>> getKeys(const Map& map) {
    std::vector<P<IString>> keys;
    keys.reserve(map.size());
    for (const auto& entry : map) keys.push_back(CString::fromUTF8(entry.first));
    return keys;
}

} // namespace

CPartitionedBucket::CPartitionedBucket() = default;

CPartitionedBucket::~CPartitionedBucket() = default;

bool CPartitionedBucket::hasObject(const CStringArg& name) const {
    return m_objects.contains(CString::toStdString(name));
}

P<IBase> CPartitionedBucket::getObject(const CStringArg& name) const {
    const auto found = m_objects.find(CString::toStdString(name));
    return found == m_objects.end() ? nullptr : found->second;
}

std::vector<P<IString>> CPartitionedBucket::getNames() const {
    return getKeys(m_objects);
}

void CPartitionedBucket::setObject(const CStringArg& name, const P<IBase>& object) {
    if (object)
        m_objects.insert_or_assign(CString::toStdString(name), object);
    else
        m_objects.erase(CString::toStdString(name));
}

void CPartitionedBucket::clear() {
    m_objects.clear();
    m_partitions.clear();
}

P<IBucket> CPartitionedBucket::getPartition(const CStringArg& key) {
    const std::string bytes = CString::toStdString(key);
    if (bytes.empty()) return P<IBucket>::share(this);
    P<IBucket>& partition = m_partitions[bytes];
    if (!partition) partition = make<CPartitionedBucket>();
    return partition;
}

std::vector<P<IString>> CPartitionedBucket::getPartitionKeys() const {
    return getKeys(m_partitions);
}

P<IBase> CPartitionedBucket::getObjectOf(const CStringArg& key, const CStringArg& name) const {
    const std::string bytes = CString::toStdString(key);
    if (bytes.empty()) return getObject(name);
    const auto found = m_partitions.find(bytes);
    return found == m_partitions.end() ? nullptr : found->second->getObject(name);
}

void CPartitionedBucket::setObjectOf(const CStringArg& key, const CStringArg& name, const P<IBase>& object) {
    getPartition(key)->setObject(name, object);
}

} // namespace peru
