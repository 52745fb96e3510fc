// Handles that cross the exported boundary.
#pragma once

#include "peru/P.h"
#include "peru/strings/String.h"

#include <string>

namespace peru {

// Two virtual operations: the destructor, then one that destroys the object itself. Not counted: whoever
// got a wrapper owns it.
class PERU_API IInstanceWrapper {
public:
    virtual ~IInstanceWrapper() = default;
    virtual void destroy() = 0;
};

// Holds a reference on the object behind a handle. No type tag. Header only: a host that hands in an object
// of its own, such as a log, links nothing for it.
class PERU_API CInstanceWrapper : public IInstanceWrapper {
public:
    explicit CInstanceWrapper(P<IBase> object) : m_object(std::move(object)) {}
    ~CInstanceWrapper() override = default;
    void destroy() override { delete this; }
    const P<IBase>& getObject() const { return m_object; }

private:
    P<IBase> m_object;
};

// Holds a text that the host reads through a std::u16string laid out as the library's own.
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
