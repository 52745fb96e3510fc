// Sets an environment variable for the current scope.
#pragma once

#include <cstdlib>
#include <optional>
#include <string>

namespace tests {

class CEnvironment {
public:
    // A null pointer removes the variable.
    CEnvironment(const char* name, const char* value) : m_name(name) {
        if (const char* old = std::getenv(name)) m_old = old;
        set(value);
    }
    CEnvironment(const char* name, const std::string& value) : CEnvironment(name, value.c_str()) {}
    ~CEnvironment() { set(m_old ? m_old->c_str() : nullptr); }
    CEnvironment(const CEnvironment&) = delete;
    CEnvironment& operator=(const CEnvironment&) = delete;

private:
    void set(const char* value) {
        if (value)
            ::setenv(m_name.c_str(), value, 1);
        else
            ::unsetenv(m_name.c_str());
    }

    std::string m_name;
    std::optional<std::string> m_old;
};

} // namespace tests
