#include "commands/Get.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "media/Download.h"
#include "media/Output.h"
#include "terminal/LiveLine.h"

#include <chrono>
#include <cstdio>
#include <stdexcept>
#include <unistd.h>

namespace host {

namespace fs = std::filesystem;

namespace {

fs::path chooseOutput(const SGetOptions& options) {
    if (!options.output.empty()) return options.output;
    fs::path name = getWebName(options.address);
    if (name.empty())
        throw std::runtime_error(tr("host.Get.noName", "The address has no file name; --output is needed"));
    return name;
}

std::string describe(int64_t received, int64_t total) {
    const std::string size = formatSize(static_cast<uint64_t>(received));
    if (total <= 0) return size;
    return tr("host.Get.progress", "%SIZE% of %TOTALSIZE%, %PERCENT% %",
              {{"%SIZE%", size},
               {"%TOTALSIZE%", formatSize(static_cast<uint64_t>(total))},
               {"%PERCENT%", std::to_string(received * 100 / total)}});
}

// False if Ctrl-C ended it.
bool fetch(const SGetOptions& options, CLiveLine& line) {
    line.start(options.address, nlohmann::json::object());
    if (!isWebAddress(options.address))
        throw std::runtime_error(tr("host.Get.onlyHttp", "Only http addresses can be read"));
    const fs::path output = chooseOutput(options);
    COutput place(output, ".part" + std::to_string(::getpid()), options.force);
    const auto started = std::chrono::steady_clock::now();
    uint64_t bytes = 0;
    const bool isDone = download(options.address, place.getTemporary(), [&](int64_t received, int64_t total) {
        bytes = static_cast<uint64_t>(received);
        if (!line.isDue()) return;
        const std::string text = describe(received, total);
        line.update(text, text, {{"received", received}, {"total", total}});
    });
    if (!isDone) {
        line.cancel({{"output", output.native()}});
        return false;
    }
    place.commit();
    const std::chrono::duration<double> seconds = std::chrono::steady_clock::now() - started;
    const double rate = static_cast<double>(bytes) / std::max(seconds.count(), 1e-6);
    line.finish(tr("host.Get.done", "%FILE%, %SIZE%, %SPEED% per second",
                   {{"%FILE%", toPrintable(output.native())},
                    {"%SIZE%", formatSize(bytes)},
                    {"%SPEED%", formatSize(static_cast<uint64_t>(rate))}}),
                {{"output", output.native()}, {"bytes", bytes}, {"seconds", seconds.count()}});
    return true;
}

} // namespace

int getFile(const SGetOptions& options) {
    CLiveLine line(options.show, "input");
    try {
        return fetch(options, line) ? kExitSuccess : kExitCancelled;
    } catch (const std::exception& error) {
        std::string reason = error.what();
        replaceAll(reason, ".part" + std::to_string(::getpid()), "");
        line.fail(asReason(reason, options.address));
        return kExitFailure;
    }
}

} // namespace host
