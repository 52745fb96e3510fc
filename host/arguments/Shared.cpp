#include "arguments/Shared.h"

#include <cmath>
#include <cstdlib>
#include <map>

namespace host {

std::string isNumber(const std::string& text) {
    return std::isnan(std::strtod(text.c_str(), nullptr)) ? "is not a number" : "";
}

void addFormat(CLI::App& command, SFormatOptions& options, const std::set<int>& widths) {
    command.add_option("--rate", options.rate, "Sample rate in Hz")
        ->option_text("HZ")
        ->check(CLI::Range(1, 768000));
    command.add_option("--channels", options.channels, "Number of channels")
        ->option_text("N")
        ->check(CLI::Range(1, 32));
    command
        .add_option("--bits", options.bits,
                    widths.size() == 1   ? "Bits per sample: 16"
                    : widths.size() == 4 ? "Bits per sample: 8, 16, 24 or 32"
                                         : "Bits per sample: 8, 16 or 24")
        ->option_text("N")
        ->check(CLI::IsMember(widths));
    command
        .add_option("--quality", options.quality,
                    "Quality from 0.0 (small) to 1.0 (best); FLAC: 1.0 is the best compression")
        ->option_text("Q")
        ->check(CLI::Range(0.0, 1.0))
        ->check(isNumber);
    const CLI::Range bitRates(1, 100'000'000);
    const auto units = CLI::AsNumberWithUnit(std::map<std::string, int>{{"k", 1000}},
                                             CLI::AsNumberWithUnit::CASE_INSENSITIVE);
    auto* bitRate = command.add_option("--bitrate", options.bitRate, "Bits per second, such as 192k")
                        ->option_text("N")
                        ->transform(units)
                        ->check(bitRates);
    command.add_option("--min-bitrate", options.minBitRate, "Minimum bits per second")
        ->option_text("N")
        ->transform(units)
        ->check(bitRates)
        ->needs(bitRate);
    command.add_option("--max-bitrate", options.maxBitRate, "Maximum bits per second")
        ->option_text("N")
        ->transform(units)
        ->check(bitRates)
        ->needs(bitRate);
}

void checkBitRates(const SFormatOptions& options) {
    if (options.minBitRate > options.bitRate)
        throw CLI::ValidationError("--min-bitrate", "is greater than --bitrate");
    if (options.maxBitRate > 0 && options.maxBitRate < options.bitRate)
        throw CLI::ValidationError("--max-bitrate", "is less than --bitrate");
}

void addOutput(CLI::App& command, EOutput& show) {
    auto* json = command.add_flag_callback(
        "--json", [&] { show = EOutput::json; }, "Print events as JSON, one per line");
    command
        .add_flag_callback(
            "-q,--quiet", [&] { show = EOutput::quiet; }, "Print failures only")
        ->excludes(json);
}

} // namespace host
