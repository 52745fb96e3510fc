// When a file was created, last read and last written.
#pragma once

#include "peru/Object.h"

#include <cstdint>
#include <limits>

namespace peru {

// Nanoseconds since 1970 UTC. kUnknown means that the file system does not record that time or, when setting
// times, that it is not to be changed.
class PERU_API CFileTimes : public CObject {
public:
    static constexpr int64_t kUnknown = std::numeric_limits<int64_t>::min();

    CFileTimes(int64_t creation, int64_t lastAccess, int64_t lastWrite)
        : m_creation(creation), m_lastAccess(lastAccess), m_lastWrite(lastWrite) {}
    ~CFileTimes() override;

    int64_t getCreationTime() const { return m_creation; }
    int64_t getLastAccessTime() const { return m_lastAccess; }
    int64_t getLastWriteTime() const { return m_lastWrite; }

private:
    int64_t m_creation;
    int64_t m_lastAccess;
    int64_t m_lastWrite;
};

} // namespace peru
