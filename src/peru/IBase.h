// The root interface of every counted object.
#pragma once

#include "peru/Api.h"

namespace peru {

class IString;
template <class T> class P;

// Every interface derives virtually from IBase, so that an object with several interfaces has one
// identity and one count. Interfaces hold no data and keep their operations in a fixed order, since
// plug-ins are compiled apart.
class PERU_API IBase {
protected:
    virtual ~IBase() = default;

public:
    // Both are atomic and may be called from any thread.
    virtual void addRef() const = 0;
    virtual void release() const = 0;

    // Called by the last release. Deletes the object, unless it lives inside another structure.
    virtual void destroy() = 0;

    // A short text for messages, by default the dynamic class name and " object".
    virtual P<IString> getObjectDesc() const = 0;
};

} // namespace peru
