// Converts between the tests' paths and the system's URIs.
#pragma once

#include "peru/Errors.h"
#include "peru/system/IPathes.h"

#include <gtest/gtest.h>

#include <filesystem>
#include <string>

namespace tests {

inline peru::P<peru::IURI> toURI(const std::filesystem::path& path) {
    return peru::getPathes()->fromPlatformPath(peru::CString::fromUTF8(path.string()));
}

inline std::string toPath(const peru::P<peru::IURI>& uri) {
    return peru::CString::toStdString(peru::getPathes()->toPlatformPath(uri));
}

inline std::string text(const peru::P<peru::IString>& string) {
    return peru::CString::toStdString(string);
}

// Returns the description of the error that the operation throws; the test fails if it throws none. Errors of
// other types propagate and fail the test as well.
template <class Error = peru::CException, class Operation> std::string errorOf(Operation operation) {
    try {
        operation();
    } catch (const Error& error) {
        return text(error.getDescription());
    }
    ADD_FAILURE() << "no error was thrown";
    return {};
}

} // namespace tests
