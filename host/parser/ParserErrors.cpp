#include "parser/ParserErrors.h"
#include "base/Translation.h"

#include <optional>
#include <span>
#include <string_view>
#include <vector>

namespace host {

namespace {

struct SMessage {
    const char* pattern; // of the parser, with placeholders; more specific ones come first
    const char* key;
    const char* text;
};

constexpr SMessage kMessages[] = {
    {"A subcommand is required", "host.parser.command", "A subcommand is required"},
    {"The following argument was not expected: %TEXT%", "host.parser.unexpected",
     "The following argument was not expected: %TEXT%"},
    {"The following arguments were not expected: %TEXT%", "host.parser.unexpectedOnes",
     "The following arguments were not expected: %TEXT%"},
    {"Could not convert: %OPTION% = %TEXT%", "host.parser.inconvertible",
     "The value is invalid: %OPTION% = %TEXT%"},
    {"%OPTION%: Value %TEXT% not in range %LOWEST% to %HIGHEST%", "host.parser.range",
     "%OPTION%: the value %TEXT% is not in the range %LOWEST% to %HIGHEST%"},
    {"%OPTION%: %TEXT% not in {%LIST%}", "host.parser.member", "%OPTION%: %TEXT% is not one of %LIST%"},
    {"%OPTION%: Check %TEXT% value in {%LIST%} OR {%NUMBERS%} FAILED", "host.parser.member",
     "%OPTION%: %TEXT% is not one of %LIST%"},
    {"%OPTION%: Check %TEXT%  FAILED", "host.parser.notAllowed", "%OPTION%: %TEXT% is not allowed"},
    {"%OPTION%: %NUMBER% required %KIND% missing", "host.parser.noValue", "%OPTION%: the value is missing"},
    {"%OPTION%: Directory does not exist: %FOLDER%", "host.parser.noFolder",
     "%OPTION%: there is no folder %FOLDER%"},
    {"%OPTION%: Directory is actually a file: %FILE%", "host.parser.fileNotFolder",
     "%OPTION%: %FILE% is a file, not a folder"},
    {"%OPTION%: At Most %NUMBER% required but received %GIVEN%", "host.parser.tooMany",
     "%OPTION%: at most %NUMBER% values are allowed, not %GIVEN%"},
    {"%NAME% is required", "host.parser.required", "%NAME% is required"},
    {"%OPTION% requires %NAME%", "host.parser.requires", "%OPTION% requires %NAME%"},
    {"%OPTION% excludes %NAME%", "host.parser.excludes", "%OPTION% excludes %NAME%"},
};

// A placeholder of the pattern at its beginning; empty if it begins with other text.
std::string_view getPlaceholder(std::string_view pattern) {
    if (!pattern.starts_with('%')) return {};
    return pattern.substr(0, pattern.find('%', 1) + 1);
}

// The parser prints limits that may be fractions with six decimals.
std::string_view trimLimit(std::string_view name, std::string_view text) {
    if ((name != "%LOWEST%" && name != "%HIGHEST%") || text.find('.') == std::string_view::npos) return text;
    text.remove_suffix(text.size() - text.find_last_not_of('0') - 1);
    return text.substr(0, text.find_last_not_of('.') + 1);
}

// The values of the pattern's placeholders in the message; empty if it does not match.
std::optional<std::vector<STextValue>> match(std::string_view pattern, std::string_view message,
                                             std::vector<std::string>& names) {
    std::vector<STextValue> values;
    names.reserve(8); // the values refer to them
    while (!pattern.empty()) {
        const std::string_view name = getPlaceholder(pattern);
        if (name.empty()) {
            const std::string_view text = pattern.substr(0, pattern.find('%'));
            if (!message.starts_with(text)) return std::nullopt;
            pattern.remove_prefix(text.size());
            message.remove_prefix(text.size());
            continue;
        }
        pattern.remove_prefix(name.size());
        const std::string_view next = pattern.substr(0, pattern.find('%'));
        const size_t end = next.empty() ? message.size() : message.find(next);
        if (end == std::string_view::npos || end == 0) return std::nullopt;
        values.push_back(
            {names.emplace_back(name).c_str(), std::string(trimLimit(name, message.substr(0, end)))});
        message.remove_prefix(end);
    }
    if (!message.empty()) return std::nullopt;
    return values;
}

} // namespace

std::string translateParserMessage(const std::string& message) {
    for (const SMessage& each : kMessages) {
        std::vector<std::string> names;
        if (const auto values = match(each.pattern, message, names))
            return tr(each.key, each.text, std::span(*values));
    }
    return message;
}

} // namespace host
