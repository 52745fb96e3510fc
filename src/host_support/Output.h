// An output file that appears complete or not at all.
#pragma once

#include "peru/Object.h"

#include <cstdint>
#include <string>

namespace tonewright::host_support {

// One thread at a time.
class COutput : public peru::CObject {
public:
    // Throws CError with the reason; see TONEWRIGHT_Host_CreateOutput.
    COutput(const std::string& path, const std::string& suffix, int32_t flags);
    ~COutput() override; // removes the temporary file, unless it was committed or kept

    const std::string& getTemporary() const { return m_temporary; }
    void commit(); // throws CError; the temporary file then remains until the destructor
    void keep() { m_isOver = true; }

private:
    void findTarget(const std::string& path);
    void nameTemporary(const std::string& suffix);
    void claim();
    void removeLeftover() const;
    void create();

    const int32_t m_flags;
    std::string m_target; // symbolic links resolved
    std::string m_temporary;
    int m_lock = -1; // the temporary file that this object created, locked
    bool m_isOver = false;
};

} // namespace tonewright::host_support
