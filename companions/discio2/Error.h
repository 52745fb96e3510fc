// Failures inside the library; the exported functions turn them into the codes of the public header.
#pragma once

#include <stdexcept>
#include <string>
#include <tonewright/discio2.h>

namespace discio {

class CDiscError : public std::runtime_error {
public:
    // `detail` names the file or drive and the reason, in UTF-8.
    CDiscError(int32_t code, const std::string& detail) : std::runtime_error(detail), m_code(code) {}
    int32_t getCode() const { return m_code; }

private:
    int32_t m_code;
};

// The text of a code, without details.
const char* describeError(int32_t code);

} // namespace discio
