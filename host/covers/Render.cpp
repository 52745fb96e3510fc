#include "Render.h"

#include "Designs.h"
#include "Failures.h"
#include "Files.h"
#include "base/Cancel.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "graphics/painting/DocumentRenderer.h"
#include "peru/Errors.h"

#include <cstdio>

namespace host::covers {

namespace {

std::string render(graphics::CGraphicDocument& document, const SRenderRequest& request) {
    graphics::SRenderOptions options;
    options.dpi = request.dpi;
    options.colourMode = request.isGrey ? graphics::EColourMode::grey : graphics::EColourMode::coloured;
    options.filter = [](const graphics::CGraphicElement&) {
        if (isCancelled()) throw peru::CAbortedError();
        return true;
    };
    if (request.output.extension() == ".pdf") return graphics::RenderPdf(document, options);
    if (request.output.extension() == ".svg") return graphics::RenderSvg(document, options);
    return graphics::RenderPng(document, options);
}

} // namespace

int renderDesign(const SRenderRequest& request) {
    return runForFile(request.file, [&] {
        requireFree(request.output, request.force, request.file);
        const P<ced::CProject> project = openProject(request.file, request.hasFileNames);
        const SDesign design = findDesign(*project, request.target, request.item);
        const std::string picture = render(*design.document, request);
        if (isCancelled()) return;
        writeFile(request.output, picture);
        const std::string name = toPrintable(design.target) + " " + std::to_string(design.item);
        std::printf("%s: %s, %s, %s\n", toPrintable(request.output.native()).c_str(), name.c_str(),
                    formatBox(design.document->GetSourceBox()).c_str(), formatSize(picture.size()).c_str());
        flushOutput();
    });
}

} // namespace host::covers
