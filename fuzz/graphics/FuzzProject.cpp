// Arbitrary bytes as a project file of any kind. What can be read is written to the same bytes twice, in both
// containers.
#include "ced/Project.h"
#include "peru/Errors.h"

#include <cstdlib>

using ced::CProject;

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    try {
        const auto project = CProject::FromBytes(std::string(reinterpret_cast<const char*>(data), size));
        const std::string archive = project->ToArchive(), xml = project->ToXml();
        if (CProject::FromBytes(archive)->ToArchive() != archive) std::abort();
        if (CProject::FromBytes(xml)->ToXml() != xml) std::abort();
    } catch (const peru::CException&) {
    }
    return 0;
}
