#include "Info.h"

#include "Attachments.h"
#include "Designs.h"
#include "Failures.h"
#include "Files.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "graphics/elements/GraphicElementType.h"
#include "peru/Errors.h"
#include "terminal/Progress.h"

#include <cstdio>
#include <map>

namespace host::covers {

namespace {

using nlohmann::json;

struct SKindName {
    ced::EProjectFile kind;
    const char* name; // in JSON
    std::string text;
};

SKindName describe(ced::EProjectFile kind) {
    switch (kind) {
    case ced::EProjectFile::exported:
        return {kind, "exported", tr("host.Covers.exported", "exported project")};
    case ced::EProjectFile::designs:
        return {kind, "template", tr("host.Covers.template", "template")};
    case ced::EProjectFile::theme:
        return {kind, "theme", tr("host.Covers.theme", "theme")};
    case ced::EProjectFile::coverPages:
        return {kind, "covers", tr("host.Covers.coverPages", "cover graphics")};
    case ced::EProjectFile::clipboard:
        return {kind, "clipboard", tr("host.Covers.clipboard", "clipboard content")};
    default:
        return {kind, "project", tr("host.Covers.project", "project")};
    }
}

json describe(const ced::CItem& item) {
    const P<graphics::CGraphicDocument>& document = item.GetDocument();
    const graphics::SRect box = document->GetSourceBox();
    json elements = json::object();
    for (const auto& element : document->GetElements()) {
        json& count = elements[graphics::GraphicTypeToXml(element->GetType())];
        count = count.is_null() ? 1 : count.get<int>() + 1;
    }
    return {{"theme", item.GetThemeName()},
            {"width", box.width},
            {"height", box.height},
            {"elements", std::move(elements)}};
}

json describe(const ced::CProject& project) {
    json targets = json::array();
    for (const auto& [name, document] : project.GetDocuments()) {
        json items = json::array();
        for (const auto& item : document->GetItems()) items.push_back(describe(*item));
        targets.push_back({{"name", name}, {"format", document->GetFormatId()}, {"items", std::move(items)}});
    }
    json formats = json::array();
    for (const ced::SXmlFragment& format : project.GetFormats()) formats.push_back(format.GetAttribute("id"));
    return {{"kind", describe(project.GetFileKind()).name},
            {"version", project.GetVersion()},
            {"later", project.IsFromLaterVersion()},
            {"creator", project.GetCreator()},
            {"coloured", project.IsColoured()},
            {"cutMarks", project.HasCutMarks()},
            {"formats", std::move(formats)},
            {"targets", std::move(targets)}};
}

// "7 shape, 2 text"
std::string listCounts(const json& elements) {
    std::string list;
    for (const auto& [type, count] : elements.items())
        list += (list.empty() ? "" : ", ") + std::to_string(count.get<int>()) + " " + type;
    return list;
}

struct SKindCount {
    int count = 0;
    int64_t bytes = 0;
};

std::string listAttachments(const json& attachments) {
    std::map<std::string, SKindCount> kinds;
    for (const json& each : attachments) {
        SKindCount& kind = kinds[each["kind"].get<std::string>()];
        ++kind.count;
        kind.bytes += each["bytes"].get<int64_t>();
    }
    std::string list;
    for (const auto& [name, kind] : kinds)
        list += (list.empty() ? "" : ", ") + std::to_string(kind.count) + " " + name + " (" +
                formatSize(static_cast<uint64_t>(kind.bytes)) + ")";
    return list;
}

void print(const std::string& label, const std::string& value) {
    if (!value.empty()) std::printf("  %s  %s\n", fitColumns(label, 14).c_str(), toPrintable(value).c_str());
}

void printText(const ced::CProject& project, const json& info, const std::filesystem::path& file) {
    std::printf("%s\n", toPrintable(file.native()).c_str());
    print(tr("host.Covers.Kind", "kind"), describe(project.GetFileKind()).text);
    print(tr("host.Covers.Version", "version"), std::to_string(project.GetVersion()));
    print(tr("host.Covers.Creator", "creator"), project.GetCreator());
    print(tr("host.Covers.Print", "print"),
          project.IsColoured() ? tr("host.Covers.coloured", "in colour") : tr("host.Covers.grey", "in grey"));
    print(tr("host.Covers.CutMarks", "cut marks"),
          project.HasCutMarks() ? tr("host.Covers.yes", "yes") : tr("host.Covers.no", "no"));
    for (const json& target : info["targets"]) {
        const std::string format = target["format"].get<std::string>();
        int number = 0;
        for (const json& item : target["items"]) {
            const std::string name = target["name"].get<std::string>() + " " + std::to_string(++number);
            print(name, formatBox({0, 0, item["width"].get<double>(), item["height"].get<double>()}));
            print("", listCounts(item["elements"]));
            if (!format.empty()) print("", tr("host.Covers.format", "format %NAME%", {{"%NAME%", format}}));
            if (const std::string theme = item["theme"].get<std::string>(); !theme.empty())
                print("", tr("host.Covers.themeName", "theme %NAME%", {{"%NAME%", theme}}));
        }
    }
    print(tr("host.Covers.Attachments", "attachments"), listAttachments(info["attachments"]));
}

// `isFirst` is true until the text of a file has been printed.
void showFile(const std::filesystem::path& file, bool isJson, bool& isFirst) {
    std::string bytes = readFile(file);
    const P<ced::CProject> project = ced::CProject::FromBytes(bytes);
    json info = describe(*project);
    json& attachments = info["attachments"] = json::array();
    forEachAttachment(*project, std::move(bytes), [&](const SAttachment& each) {
        if (isCancelled()) throw peru::CAbortedError();
        attachments.push_back(
            {{"name", each.name}, {"kind", each.kind}, {"bytes", each.bytes ? each.bytes->getSize() : 0}});
    });
    info["file"] = file.native();
    if (isJson) {
        std::printf("%s\n", toLine(info).c_str());
        return;
    }
    if (!std::exchange(isFirst, false)) std::printf("\n");
    printText(*project, info, file);
}

} // namespace

int showInfo(const SInfoOptions& options) {
    int result = kExitSuccess;
    bool isFirst = true;
    for (const std::filesystem::path& file : options.files) {
        const int code = runForFile(
            file, [&] { showFile(file, options.isJson, isFirst); }, options.isJson);
        if (code == kExitCancelled) return code;
        if (code != kExitSuccess) result = code;
        if (!flushOutput()) break;
    }
    return result;
}

} // namespace host::covers
