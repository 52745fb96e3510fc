#include "arguments/Shared.h"

#include "base/Translation.h"

#include <algorithm>
#include <cmath>
#include <cstdlib>
#include <thread>

namespace host {

std::string toWholeNumber(std::string& text, const std::string& unit) {
    char* end = nullptr;
    double number = std::strtod(text.c_str(), &end);
    std::string rest = CLI::detail::to_lower(CLI::detail::trim_copy(end));
    if (end == text.c_str() || !std::isfinite(number))
        return tr("host.arguments.notANumber", "%TEXT% is not a number", {{"%TEXT%", text}});
    if (rest.ends_with(unit)) rest.resize(rest.size() - unit.size());
    if (rest == "k")
        number *= 1000;
    else if (!rest.empty())
        return tr("host.arguments.unit", "%TEXT% has an unknown unit", {{"%TEXT%", text}});
    // The product of a decimal fraction may miss the whole number by a rounding error.
    const double whole = std::round(number);
    if (std::abs(number - whole) > 1e-6 || std::abs(whole) > 1e9)
        return tr("host.arguments.notWhole", "%TEXT% is not a whole number", {{"%TEXT%", text}});
    text = std::to_string(static_cast<long>(whole));
    return "";
}

namespace {

CLI::Validator numberOf(const std::string& unit) {
    return CLI::Validator([unit](std::string& text) { return toWholeNumber(text, unit); }, "");
}

// 192 is a slip far more often than a wish.
std::string isBitRate(const std::string& text) {
    const long bitRate = std::strtol(text.c_str(), nullptr, 10);
    if (bitRate >= 1000 && bitRate <= 100'000'000) return "";
    if (bitRate > 0 && bitRate < 1000)
        return tr("host.arguments.fewBits", "%TEXT% bits per second are too few; %TEXT%k means %TEXT%000",
                  {{"%TEXT%", text}});
    return tr("host.arguments.bitRate", "%TEXT% is not between 1k and 100000k", {{"%TEXT%", text}});
}

} // namespace

void addFormat(CLI::App& command, SFormatOptions& options, const std::set<int>& widths) {
    command.add_option("--rate", options.rate, tr("host.help.rate", "Sample rate, such as 48000 or 44.1k"))
        ->option_text("HZ")
        ->transform(numberOf("hz"))
        ->check(CLI::Range(1, 768000));
    command.add_option("--channels", options.channels, tr("host.help.channels", "Number of channels"))
        ->option_text("N")
        ->check(CLI::Range(1, 32));
    command
        .add_option("--bits", options.bits,
                    widths.size() == 1   ? tr("host.help.bits16", "Bits per sample: 16")
                    : widths.size() == 4 ? tr("host.help.bits32", "Bits per sample: 8, 16, 24 or 32")
                                         : tr("host.help.bits24", "Bits per sample: 8, 16 or 24"))
        ->option_text("N")
        ->check(CLI::IsMember(widths));
    auto* quality =
        command
            .add_option("--quality", options.quality,
                        tr("host.help.quality",
                           "Quality from 0.0 (small) to 1.0 (best); FLAC: 1.0 is the best compression"))
            ->option_text("Q")
            ->check(CLI::Range(0.0, 1.0))
            ->check(isNumber);
    auto* bitRate = command
                        .add_option("--bitrate", options.bitRate,
                                    tr("host.help.bitrate", "Bits per second, such as 192k"))
                        ->option_text("N")
                        ->transform(numberOf("bit/s"))
                        ->check(isBitRate)
                        ->excludes(quality);
    command
        .add_option("--min-bitrate", options.minBitRate,
                    tr("host.help.minBitrate", "Minimum bits per second"))
        ->option_text("N")
        ->transform(numberOf("bit/s"))
        ->check(isBitRate)
        ->needs(bitRate);
    command
        .add_option("--max-bitrate", options.maxBitRate,
                    tr("host.help.maxBitrate", "Maximum bits per second"))
        ->option_text("N")
        ->transform(numberOf("bit/s"))
        ->check(isBitRate)
        ->needs(bitRate);
}

void checkBitRates(const SFormatOptions& options) {
    if (options.minBitRate > options.bitRate)
        throw CLI::ValidationError("--min-bitrate",
                                   tr("host.arguments.aboveBitrate", "is greater than --bitrate"));
    if (options.maxBitRate > 0 && options.maxBitRate < options.bitRate)
        throw CLI::ValidationError("--max-bitrate",
                                   tr("host.arguments.belowBitrate", "is less than --bitrate"));
}

std::string isLoudness(const std::string& text) {
    char* end = nullptr;
    const double level = std::strtod(text.c_str(), &end);
    return end != text.c_str() && *end == '\0' && level >= -70.0 && level <= 0.0
               ? ""
               : tr("host.arguments.loudness", "%TEXT% is not a loudness from -70 to 0 LUFS",
                    {{"%TEXT%", text}});
}

void addJobs(CLI::App& command, int& jobs, const std::string& help) {
    jobs = static_cast<int>(std::max(std::thread::hardware_concurrency(), 1u));
    command.add_option("-j,--jobs", jobs, help)->option_text("N")->check(CLI::Range(1, 256));
}

void addBoxed(CLI::App& app, std::string& plugins) {
    app.add_flag(
           "--boxed{all}", plugins,
           tr("host.help.boxed",
              "Run plug-ins in processes of their own, so that one that crashes on a damaged file does not "
              "end the job: all, none, or names separated by commas, such as --boxed=flac,vorbis"))
        ->check([](const std::string& list) {
            return list.find_first_of(" ;/") == std::string::npos
                       ? std::string()
                       : tr("host.arguments.boxed", "names are separated by commas");
        });
}

void addOutput(CLI::App& command, EOutput& show) {
    auto* json = command.add_flag_callback(
        "--json", [&] { show = EOutput::json; }, tr("host.help.json", "Print events as JSON, one per line"));
    command
        .add_flag_callback(
            "-q,--quiet", [&] { show = EOutput::quiet; }, tr("host.help.quiet", "Print failures only"))
        ->excludes(json);
}

} // namespace host
