#include "media/PrivateFolder.h"

#include "base/Translation.h"

#include <cerrno>
#include <cstdlib>
#include <cstring>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

CPrivateFolder::CPrivateFolder() {
    const char* chosen = std::getenv("TMPDIR");
    const fs::path parent = chosen && *chosen ? chosen : "/tmp";
    std::string name = fs::absolute(parent / "tonewright-XXXXXX");
    if (!::mkdtemp(name.data()))
        throw std::runtime_error(tr("host.temporaryFolder",
                                    "No temporary folder can be created in %FOLDER%: %REASON%",
                                    {{"%FOLDER%", parent.string()}, {"%REASON%", std::strerror(errno)}}));
    m_path = name;
}

CPrivateFolder::~CPrivateFolder() {
    std::error_code none;
    fs::remove_all(m_path, none);
}

} // namespace host
