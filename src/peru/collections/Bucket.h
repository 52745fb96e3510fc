// Named objects, split into partitions.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"

#include <map>
#include <vector>

namespace peru {

class PERU_API IConstBucket : public virtual IBase {
public:
    virtual bool hasObject(const CStringArg& name) const = 0;
    virtual P<IBase> getObject(const CStringArg& name) const = 0; // empty if there is none
    virtual std::vector<P<IString>> getNames() const = 0;         // sorted by UTF-8 bytes
};

class PERU_API IBucket : public virtual IConstBucket {
public:
    virtual void setObject(const CStringArg& name,
                           const P<IBase>& object) = 0; // an empty handle removes the entry
    virtual void clear() = 0;
};

// A bucket whose own objects belong to the empty partition key. Not thread-safe.
class PERU_API IPartitionedBucket : public virtual IBucket {
public:
    // Returns this bucket for an empty key, otherwise the partition, which is created on first use.
    virtual P<IBucket> getPartition(const CStringArg& key) = 0;
    virtual std::vector<P<IString>> getPartitionKeys() const = 0;
    // Looks the object up in the partition; a missing partition counts as empty and is not created.
    virtual P<IBase> getObjectOf(const CStringArg& key, const CStringArg& name) const = 0;
    virtual void setObjectOf(const CStringArg& key, const CStringArg& name, const P<IBase>& object) = 0;
};

class PERU_API CPartitionedBucket : public CObject, public IPartitionedBucket {
public:
    CPartitionedBucket();
    ~CPartitionedBucket() override;

    bool hasObject(const CStringArg& name) const override;
    P<IBase> getObject(const CStringArg& name) const override;
    std::vector<P<IString>> getNames() const override;
    void setObject(const CStringArg& name, const P<IBase>& object) override;
    void clear() override; // including the partitions

    P<IBucket> getPartition(const CStringArg& key) override;
    std::vector<P<IString>> getPartitionKeys() const override;
    P<IBase> getObjectOf(const CStringArg& key, const CStringArg& name) const override;
    void setObjectOf(const CStringArg& key, const CStringArg& name, const P<IBase>& object) override;

private:
    // Keyed by UTF-8 bytes, so that equal names in different encodings are one key.
    std::map<std::string, P<IBase>, std::less<>> m_objects;
    std::map<std::string, P<IBucket>, std::less<>> m_partitions;
};

} // namespace peru
