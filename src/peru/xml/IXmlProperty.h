// One attribute of an XML element.
#pragma once

#include "peru/strings/IString.h"

namespace peru {

// Names its attribute by the element and its name: when either is removed the value can no longer be read or
// set, which throws CInvalidObjectStateError.
class PERU_API IXmlProperty : public virtual IBase {
public:
    virtual P<IString> getName() const = 0;
    virtual P<IString> getValue() const = 0;
    virtual void setValue(const CStringArg& value) = 0;
};

} // namespace peru
