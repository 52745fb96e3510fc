// One attribute of an XML element.
#pragma once

#include "peru/strings/IString.h"

namespace peru {

// Refers to its attribute by element and name. Once either is removed, reading or setting the value throws
// CInvalidObjectStateError.
class PERU_API IXmlProperty : public virtual IBase {
public:
    virtual P<IString> getName() const = 0;
    virtual P<IString> getValue() const = 0;
    virtual void setValue(const CStringArg& value) = 0;
};

} // namespace peru
