// Objects by name.
#pragma once

#include "peru/collections/IEnum.h"
#include "peru/strings/IString.h"

namespace peru {

// The values are boxes (ValueBoxes.h), strings or any other objects. Not thread-safe.
class PERU_API IValueList : public virtual IBase {
public:
    virtual void setValue(const CStringArg& name, const P<IBase>& value) = 0; // adds or replaces
    virtual P<IBase> getValue(const CStringArg& name) const = 0;              // empty if there is none
    virtual bool hasValue(const CStringArg& name) const = 0;
    virtual void removeValue(const CStringArg& name) = 0; // does nothing if there is none
    virtual void clear() = 0;
    virtual int32_t getCount() const = 0;
    // The current names, in no particular order.
    virtual WEnum<IString> getNames() const = 0;
};

} // namespace peru
