#include "commands/ConversionPlan.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Download.h"
#include "media/FileTag.h"
#include "media/InputContent.h"
#include "media/InputFiles.h"
#include "media/SoundFile.h"

#include <exception>
#include <set>
#include <sys/stat.h>
#include <tonewright/host.h>
#include <unistd.h>
#include <utility>

namespace host {

namespace fs = std::filesystem;

namespace {

using FileId = std::pair<dev_t, ino_t>;

std::optional<FileId> identify(const fs::path& file) {
    struct stat status;
    if (::stat(file.c_str(), &status) != 0) return std::nullopt;
    return FileId(status.st_dev, status.st_ino);
}

// The same for all names of a file, whether it exists or not.
fs::path toUniquePath(const fs::path& file) {
    std::error_code error;
    const fs::path absolute = fs::absolute(file);
    const fs::path unique = fs::weakly_canonical(absolute, error);
    return error ? absolute.lexically_normal() : unique;
}

CNamePattern::Fields readFields(CLibrary& library, const fs::path& file) {
    CNamePattern::Fields fields{{"name", file.stem().native()}};
    checkInput(file);
    if (const CFileTag tag(library, file); tag)
        for (const STagField& field : getTagFields()) fields[field.name] = toUTF8(tag.get(field).c_str());
    return fields;
}

fs::path chooseOutput(CLibrary& library, const SConvertOptions& options, const SInputFile& input) {
    if (!options.output.empty()) return options.output;
    if (options.names) {
        const std::string dot = options.extension.starts_with('.') ? "" : ".";
        if (isWebAddress(input.file))
            throw std::runtime_error(
                tr("host.Convert.nameOfAddress", "--name cannot name the copy of an address"));
        const fs::path& folder = options.directory.empty() ? input.file.parent_path() : options.directory;
        return folder / options.names->expand(readFields(library, input.file), dot + options.extension);
    }
    const bool isWeb = isWebAddress(input.file);
    fs::path name = isWeb ? getWebName(input.file) : input.file.filename();
    if (isWeb && name.empty())
        throw std::runtime_error(tr("host.Get.noName", "The address has no file name; --output is needed"));
    name.replace_extension(options.extension);
    const fs::path beside =
        isWeb ? fs::path() : input.file.parent_path(); // a copy goes to the current folder
    return (options.directory.empty() ? beside : options.directory / input.below) / name;
}

std::string findFolderProblem(fs::path folder) {
    std::error_code none;
    folder = fs::absolute(folder);
    while (!fs::exists(folder, none) && folder.has_relative_path()) folder = folder.parent_path();
    if (!fs::is_directory(folder, none))
        return tr("host.notAFolder", "%FILE% is not a folder", {{"%FILE%", folder.string()}});
    if (::access(folder.c_str(), W_OK | X_OK) != 0)
        return tr("host.readOnlyFolder", "The folder %FOLDER% cannot be written to",
                  {{"%FOLDER%", folder.string()}});
    return "";
}

} // namespace

std::vector<SConversion> planConversions(CLibrary& library, const SConvertOptions& options) {
    const std::vector<SInputFile> inputs =
        listInputs(library, options.inputs, options.recursive, options.directory);
    std::set<FileId> sources;
    for (const SInputFile& input : inputs)
        if (const auto id = identify(input.file)) sources.insert(*id);

    std::vector<SConversion> plan;
    std::set<fs::path> taken;
    for (const SInputFile& input : inputs) {
        SConversion conversion{input.file, {}, input.problem};
        try {
            if (conversion.problem.empty()) conversion.output = chooseOutput(library, options, input);
        } catch (const std::exception& error) {
            conversion.problem = error.what();
        }
        if (conversion.problem.empty() && !isStandardStream(conversion.output)) {
            // With --skip, an output that exists is not touched, whatever it is.
            const auto id = options.existing == EExisting::skip ? std::nullopt : identify(conversion.output);
            if (id && isSameFile(input.file, conversion.output))
                conversion.problem = tr("host.sameFile", "Input and output are the same file");
            else if (id && sources.count(*id) > 0)
                conversion.problem = tr("host.Convert.isInput", "The output %FILE% is another input",
                                        {{"%FILE%", conversion.output.string()}});
            else if (!taken.insert(toUniquePath(conversion.output)).second)
                conversion.problem =
                    tr("host.Convert.sameOutput", "Another input is already converted to %FILE%",
                       {{"%FILE%", conversion.output.string()}});
        }
        plan.push_back(std::move(conversion));
    }
    return plan;
}

bool createsFolders(const SConvertOptions& options) {
    return !options.directory.empty() || options.names;
}

std::string findProblem(const SConversion& conversion, const SConvertOptions& options) {
    if (!conversion.problem.empty()) return conversion.problem;
    const fs::path& output = conversion.output;
    if (!isStandardStream(conversion.input) && !isWebAddress(conversion.input)) checkInput(conversion.input);
    if (isStandardStream(output)) return "";
    std::error_code none;
    if (fs::is_directory(output, none))
        return tr("host.isDirectory", "%FILE% cannot be written: Is a directory",
                  {{"%FILE%", output.string()}});
    if (fs::exists(output, none) && !fs::is_regular_file(output, none))
        return tr(
            "host.unwritableReason", "%FILE% cannot be written: %REASON%",
            {{"%FILE%", output.string()}, {"%REASON%", tr("host.notRegular", "Is not a regular file")}});
    if (options.existing == EExisting::refuse && fs::exists(output, none))
        return tr("host.existsForce", "%FILE% exists (--force replaces it)", {{"%FILE%", output.string()}});
    clearFailure();
    if (TONEWRIGHT_Host_GetCapabilities(toURI(output).c_str(), nullptr) != 1)
        return takeFailure(
            tr("host.noWriter", "No plug-in writes %KIND%", {{"%KIND%", describeKind(output)}}));
    const fs::path folder = output.has_parent_path() ? output.parent_path() : ".";
    if (!createsFolders(options) && !fs::exists(folder, none))
        return tr("host.noFolder", "The folder %FOLDER% does not exist", {{"%FOLDER%", folder.string()}});
    return findFolderProblem(folder);
}

} // namespace host
