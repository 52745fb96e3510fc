// Handles that cross the exported boundary.
#pragma once

#include "peru/P.h"
#include "peru/strings/String.h"

#include <string>

namespace peru {

// Two virtual operations: the destructor, then destroy(), which deletes the wrapper. Not reference-counted:
// whoever receives a wrapper owns it.
class PERU_API IInstanceWrapper {
public:
    virtual ~IInstanceWrapper() = default;
    virtual void destroy() = 0;
};

// Holds a reference to the object behind a handle, without a type tag. Header-only, so that a host can pass
// an object of its own, such as a log, without linking anything for it.
class PERU_API CInstanceWrapper : public IInstanceWrapper {
public:
    explicit CInstanceWrapper(P<IBase> object) : m_object(std::move(object)) {}
    ~CInstanceWrapper() override = default;
    void destroy() override { delete this; }
    const P<IBase>& getObject() const { return m_object; }

private:
    P<IBase> m_object;
};

// Holds a text that the host reads as a std::u16string with the same layout as the library's.
class PERU_API CStringInstanceWrapper : public IInstanceWrapper {
public:
    explicit CStringInstanceWrapper(const CStringArg& text);
    ~CStringInstanceWrapper() override;
    void destroy() override;
    const std::u16string& getText() const { return m_text; }

private:
    std::u16string m_text;
};

} // namespace peru
