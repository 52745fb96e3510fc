// Polymorphic arrays of objects.
#pragma once

#include "peru/collections/IEnum.h"

namespace peru {

// Indices outside the array throw CInvalidArgError. Not thread-safe.
class PERU_API IConstArray : public virtual IBase {
public:
    virtual int32_t getCount() const = 0;
    virtual PC<IBase> getConstAt(int32_t index) const = 0;
    // Enumerators keep the array alive and see its changes.
    virtual P<IConstEnum> createConstEnum(bool backwards = false) const = 0;
};

class PERU_API IArray : public virtual IConstArray {
public:
    virtual P<IBase> getAt(int32_t index) const = 0;
    virtual P<IEnum> createEnum(bool backwards = false) = 0;
    virtual void add(const P<IBase>& element) = 0;
    // The index may equal the count, which appends the element.
    virtual void insertAt(int32_t index, const P<IBase>& element) = 0;
    virtual void setAt(int32_t index, const P<IBase>& element) = 0;
    virtual void removeAt(int32_t index) = 0;
    // Removes the first occurrence of the object and returns whether there was one.
    virtual bool remove(const P<IBase>& element) = 0;
    virtual void clear() = 0;
};

} // namespace peru
