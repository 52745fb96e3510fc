#include "Convert.h"

#include "Failures.h"
#include "Files.h"
#include "base/Cancel.h"

namespace host::covers {

int convertProject(const SConvertRequest& request) {
    return runForFile(request.file, [&] {
        requireFree(request.output, request.force, request.file);
        const P<ced::CProject> project = openProject(request.file, request.hasFileNames);
        if (isCancelled()) return;
        const std::string bytes = request.output.extension() == ".xml"
                                      ? project->ToXml(request.hasFileNames ? ced::CProject::EMode::fileNames
                                                                            : ced::CProject::EMode::embedded)
                                      : project->ToArchive(request.isLossless);
        if (!isCancelled()) writeFile(request.output, bytes);
    });
}

} // namespace host::covers
