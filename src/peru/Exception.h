// The root of the exception tree.
#pragma once

#include "peru/Object.h"

#include <exception>

namespace peru {

// Both a standard exception and a counted object. Thrown by value, caught by reference.
class PERU_API CException : public std::exception, public CObject {
public:
    CException(const P<IString>& description, const P<IString>& title);
    CException(const CException&) = default;
    CException& operator=(const CException&) = default;
    ~CException() override;

    // 8-bit text in the system code page, valid until the next call on this thread.
    const char* what() const noexcept override;
    virtual P<IString> getTitle() const;
    virtual P<IString> getDescription() const;
    // Returns a heap copy of the most derived type, which can be passed to another thread.
    virtual P<CException> clone() const;
    // Throws a copy of the most derived type: rethrows what clone() has copied.
    [[noreturn]] virtual void raise() const;

protected:
    P<IString> m_title;
    P<IString> m_description;
};

// Declares the two operations that every class of the tree overrides.
#define PERU_EXCEPTION(Class)                                                                                \
public:                                                                                                      \
    Class(const Class&) = default;                                                                           \
    Class& operator=(const Class&) = default;                                                                \
    ~Class() override;                                                                                       \
    ::peru::P<::peru::CException> clone() const override;                                                    \
    [[noreturn]] void raise() const override;

#define PERU_EXCEPTION_IMPL(Class)                                                                           \
    Class::~Class() = default;                                                                               \
    ::peru::P<::peru::CException> Class::clone() const {                                                     \
        Class* copy = new Class(*this);                                                                      \
        copy->resetCount();                                                                                  \
        return ::peru::P<::peru::CException>(copy);                                                          \
    }                                                                                                        \
    void Class::raise() const {                                                                              \
        throw *this;                                                                                         \
    }

} // namespace peru
