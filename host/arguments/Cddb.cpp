#include "arguments/Cddb.h"
#include "arguments/Arguments.h"
#include "base/Translation.h"
#include "commands/Cddb.h"

#include <charconv>
#include <cstdlib>
#include <memory>
#include <stdexcept>

namespace host {

namespace {

// HOST[:PORT][/PATH], optionally with "http://" in front.
SCddbServer parseServer(std::string text) {
    const auto refuse = [&text] {
        throw CLI::ValidationError(
            "--server", tr("host.Cddb.server", "%TEXT% is not HOST[:PORT][/PATH]", {{"%TEXT%", text}}));
    };
    SCddbServer server;
    std::string authority = text.starts_with("http://") ? text.substr(7) : text;
    const size_t slash = std::min(authority.find('/'), authority.size());
    server.path = authority.substr(slash);
    if (server.path == "/") server.path.clear();
    authority.resize(slash);
    const size_t colon = authority.rfind(':');
    const bool hasPort = colon != std::string::npos && authority.find(']', colon) == std::string::npos;
    if (hasPort) {
        const char *const begin = authority.data() + colon + 1, *const end =
                                                                    authority.data() + authority.size();
        const auto [stop, error] = std::from_chars(begin, end, server.port);
        if (error != std::errc() || stop != end || server.port < 1 || server.port > 65535) refuse();
        authority.resize(colon);
    }
    server.host = authority;
    if (server.host.empty() || server.host.find_first_of("@?# \t") != std::string::npos) refuse();
    return server;
}

} // namespace

void addCddbAccess(CLI::App& command, SCddbAccess& access) {
    command
        .add_option_function<std::string>(
            "--server", [&](const std::string& text) { access.server = parseServer(text); },
            tr("host.help.cddb.server", "CDDB server (default: $TONEWRIGHT_CDDB_SERVER)"))
        ->option_text("HOST[:PORT][/PATH]");
    command
        .add_option_function<std::string>(
            "--user",
            [&](const std::string& text) {
                const size_t at = text.rfind('@');
                if (at == 0 || at == std::string::npos || at + 1 == text.size())
                    throw CLI::ValidationError("--user", tr("host.Cddb.user", "must be NAME@HOST"));
                access.user = text.substr(0, at);
                access.userHost = text.substr(at + 1);
            },
            tr("host.help.cddb.user", "What the server is told about the user (default: anon@anon)"))
        ->option_text("NAME@HOST");
    command
        .add_option_function<std::string>(
            "--proxy", [&](const std::string& text) { access.proxy = text; },
            tr("host.help.cddb.proxy", "Proxy to use, or none if empty (default: that of the system)"))
        ->option_text("HOST[:PORT]");
    command
        .add_option("--timeout", access.timeout,
                    tr("host.help.cddb.timeout", "Seconds that each request may take"))
        ->option_text("SECONDS")
        ->check(CLI::Range(0.001, 1e6))
        ->check(isNumber);
    command
        .add_option("--code-page", access.codePage,
                    tr("host.help.cddb.codePage", "Encoding of replies that are not UTF-8, such as SHIFT_JIS "
                                                  "(default: Windows-1252)"))
        ->option_text("NAME");
    auto* noCache = command.add_flag_callback(
        "--no-cache", [&] { access.useCache = false; },
        tr("host.help.cddb.noCache",
           "Neither read nor write the answers stored in $XDG_CACHE_HOME/tonewright"));
    command
        .add_flag("--refresh", access.refresh,
                  tr("host.help.cddb.refresh", "Ask the server even if its answer is stored"))
        ->excludes(noCache);
}

void addCddbPick(CLI::App& command, int& pick) {
    command
        .add_option("--pick", pick,
                    tr("host.help.cddb.pick", "Read the record with this number where several fit"))
        ->option_text("N")
        ->check(CLI::Range(1, 10000));
}

void requireCddbServer(SCddbAccess& access) {
    const char* const usual = std::getenv("TONEWRIGHT_CDDB_SERVER");
    if (access.server.host.empty() && usual && *usual) access.server = parseServer(usual);
    if (access.server.host.empty()) throw CLI::RequiredError("--server");
}

void addCddb(CLI::App& app, Run& run) {
    const auto options = std::make_shared<SCddbOptions>();
    CLI::App* command = app.add_subcommand(
        "cddb", tr("host.help.cddb", "Look up an audio CD on a CDDB server: artist, album, titles. Answers "
                                     "are stored, so a disc is\nlooked up only once."));
    auto* input = command
                      ->add_option("DISC", options->input,
                                   tr("host.help.cddb.DISC",
                                      "A drive by its path in tonewright drives, a disc image (.cue, .toc, "
                                      ".nrg) or the cue sheet of\nsound files; by default the first drive "
                                      "with a disc"))
                      ->option_text(" ");
    command
        ->add_option_function<std::string>(
            "--toc",
            [options](const std::string& text) {
                try {
                    options->toc = parseDiscToc(text);
                } catch (const std::invalid_argument& error) {
                    throw CLI::ValidationError("--toc", error.what());
                }
            },
            tr("host.help.cddb.toc", "Offsets of the tracks and of the lead-out in frames of 1/75 second, "
                                     "such as\n'150 17827 33215 50640'"))
        ->option_text("FRAMES")
        ->excludes(input);
    addCddbAccess(*command, *options);
    addCddbPick(*command, options->pick);
    command->add_flag("--list", options->list, tr("host.help.cddb.list", "Only list the records that fit"));
    command->add_flag("--json", options->json, tr("host.help.jsonObject", "Print a JSON object"));
    command->callback([options, &run] {
        requireCddbServer(*options);
        run = [options](CLibrary&) { return lookUpDisc(*options); };
    });
}

} // namespace host
