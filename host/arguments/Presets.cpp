#include "arguments/Presets.h"

#include "base/Translation.h"

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <filesystem>
#include <fstream>
#include <map>
#include <sstream>
#include <string>
#include <utility>
#include <vector>

namespace host {

namespace fs = std::filesystem;

namespace {

using Settings = std::vector<std::pair<std::string, std::string>>; // option without hyphens, value

struct SPreset {
    Settings settings;
    std::string purpose;
    std::string origin; // for messages
};

const char* const kKeys[] = {"to",      "rate",        "channels",    "bits",      "quality",
                             "bitrate", "min-bitrate", "max-bitrate", "resampler", "normalize"};
const char* const kCompression[] = {"quality", "bitrate", "min-bitrate", "max-bitrate"};

const struct {
    const char* name;
    const char* key;
    const char* purpose;
    Settings settings;
} kBuiltIn[] = {
    {"archive",
     "host.Presets.archive",
     "everything the input holds, as small as possible",
     {{"to", "flac"}, {"quality", "1.0"}}},
    {"cd",
     "host.Presets.cd",
     "sound for an audio CD",
     {{"to", "wav"}, {"rate", "44100"}, {"channels", "2"}, {"bits", "16"}, {"resampler", "best"}}},
    {"phone",
     "host.Presets.phone",
     "announcements for telephone systems",
     {{"to", "wav"}, {"rate", "8000"}, {"channels", "1"}, {"bits", "16"}}},
    {"podcast",
     "host.Presets.podcast",
     "speech for any player, about 43 MB per hour",
     {{"to", "mp3"}, {"rate", "44100"}, {"channels", "1"}, {"bitrate", "96k"}}},
    {"portable",
     "host.Presets.portable",
     "music for any player, hardly distinguishable",
     {{"to", "mp3"}, {"quality", "0.8"}}},
    {"speech",
     "host.Presets.speech",
     "speech, small",
     {{"to", "ogg"}, {"rate", "24000"}, {"channels", "1"}, {"quality", "0.2"}}},
};

bool isCompression(const std::string& key) {
    return std::find(std::begin(kCompression), std::end(kCompression), key) != std::end(kCompression);
}

fs::path getPresetFolder() {
    const char* configuration = std::getenv("XDG_CONFIG_HOME");
    if (configuration && *configuration == '/') return fs::path(configuration) / "tonewright/presets";
    const char* home = std::getenv("HOME");
    return home && *home ? fs::path(home) / ".config/tonewright/presets" : fs::path();
}

[[noreturn]] void fail(const std::string& reason) {
    throw CLI::ValidationError("--preset", reason);
}

std::string join(const Settings& settings) {
    std::string text;
    for (const auto& [key, value] : settings) text += (text.empty() ? "" : ", ") + key + " " + value;
    return text;
}

SPreset readPreset(const fs::path& file) {
    std::ifstream stream(file);
    std::stringstream text;
    if (!stream || !(text << stream.rdbuf()))
        fail(tr("host.Presets.unreadable", "%FILE% cannot be read", {{"%FILE%", file.string()}}));
    SPreset preset{{}, "", file.string()};
    for (const CLI::ConfigItem& item : CLI::ConfigINI().from_config(text)) {
        if (!item.parents.empty())
            fail(tr("host.Presets.section", "%FILE%: sections, such as %NAME%, have no meaning",
                    {{"%FILE%", file.string()}, {"%NAME%", item.parents[0]}}));
        if (std::find(std::begin(kKeys), std::end(kKeys), item.name) == std::end(kKeys)) {
            std::string known;
            for (const char* key : kKeys) known += std::string(known.empty() ? "" : ", ") + key;
            fail(tr("host.Presets.key", "%FILE%: %NAME% is not a key; known are %LIST%",
                    {{"%FILE%", file.string()}, {"%NAME%", item.name}, {"%LIST%", known}}));
        }
        if (item.inputs.size() != 1)
            fail(tr("host.Presets.oneValue", "%FILE%: %NAME% takes one value",
                    {{"%FILE%", file.string()}, {"%NAME%", item.name}}));
        preset.settings.emplace_back(item.name, item.inputs[0]);
    }
    if (preset.settings.empty())
        fail(tr("host.Presets.empty", "%FILE% sets nothing", {{"%FILE%", file.string()}}));
    return preset;
}

std::map<std::string, fs::path> listFiles() {
    std::map<std::string, fs::path> files;
    std::error_code error;
    for (fs::directory_iterator entry(getPresetFolder(), error), end; !error && entry != end;
         entry.increment(error))
        if (entry->path().extension() == ".ini") files[entry->path().stem()] = entry->path();
    return files;
}

SPreset findPreset(const std::string& name) {
    const auto files = listFiles();
    if (const auto file = files.find(name); file != files.end()) return readPreset(file->second);
    std::string known;
    for (const auto& preset : kBuiltIn) {
        if (name == preset.name)
            return {preset.settings, tr(preset.key, preset.purpose),
                    tr("host.Presets.preset", "the preset %NAME%", {{"%NAME%", name}})};
        known += std::string(known.empty() ? "" : ", ") + preset.name;
    }
    for (const auto& [own, file] : files) known += ", " + own;
    fail(tr("host.Presets.unknown", "there is no preset %NAME%; known are %LIST%",
            {{"%NAME%", name}, {"%LIST%", known}}));
}

void listPresets() {
    const auto files = listFiles();
    for (const auto& preset : kBuiltIn)
        if (files.count(preset.name) == 0)
            std::printf("%-12s %s: %s\n", preset.name, tr(preset.key, preset.purpose).c_str(),
                        join(preset.settings).c_str());
    for (const auto& [name, file] : files) std::printf("%-12s %s\n", name.c_str(), file.c_str());
    std::fflush(stdout);
    throw CLI::Success();
}

} // namespace

void addPresets(CLI::App& command) {
    command.add_option("--preset")
        ->description(tr("host.help.convert.preset",
                         "Options by name, such as podcast; others on the command line win"))
        ->option_text("NAME");
    command.add_flag_callback("--list-presets", listPresets,
                              tr("host.help.convert.listPresets", "List the presets and end"));
}

void applyPreset(CLI::App& command) {
    const CLI::Option* chosen = command.get_option("--preset");
    if (chosen->count() == 0) return;
    const SPreset preset = findPreset(chosen->as<std::string>());
    const auto isSet = [&](const std::string& key) { return command.get_option("--" + key)->count() > 0; };
    const bool ownCompression = std::any_of(std::begin(kCompression), std::end(kCompression), isSet);
    const CLI::Option* output = command.get_option("--output");
    std::error_code none;
    const std::string target = output->count() > 0 ? output->as<std::string>() : std::string();
    const bool namesFile =
        !target.empty() && target != "-" && !target.ends_with('/') && !fs::is_directory(target, none);
    std::map<std::string, bool> seen;
    for (const auto& [key, value] : preset.settings) {
        if (!std::exchange(seen[key], true)) {
            if (isSet(key)) continue;
        } else {
            fail(tr("host.Presets.twice", "%ORIGIN%: %NAME% is set twice",
                    {{"%ORIGIN%", preset.origin}, {"%NAME%", key}}));
        }
        if ((isCompression(key) && ownCompression) || (key == "to" && namesFile)) continue;
        try {
            command.get_option("--" + key)->add_result(value)->run_callback();
        } catch (const CLI::ParseError& error) {
            fail(preset.origin + ": " + error.what());
        }
    }
    const auto has = [&](const char* key) { return seen.count(key) > 0; };
    if (has("quality") && has("bitrate"))
        fail(tr("host.Presets.exclusive", "%ORIGIN%: quality and bitrate exclude each other",
                {{"%ORIGIN%", preset.origin}}));
    for (const char* limit : {"min-bitrate", "max-bitrate"})
        if (has(limit) && !has("bitrate"))
            fail(tr("host.Presets.needsBitrate", "%ORIGIN%: %NAME% needs bitrate",
                    {{"%ORIGIN%", preset.origin}, {"%NAME%", limit}}));
}

} // namespace host
