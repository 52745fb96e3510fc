// tonewright burn
#include "commands/Burn.h"
#include "base/Cancel.h"
#include "base/ExitCodes.h"
#include "base/Text.h"
#include "base/Translation.h"
#include "commands/BurnTracks.h"
#include "media/Disc.h"
#include "media/DiscFiles.h"
#include "media/FormatOptions.h"
#include "media/InputFiles.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <chrono>
#include <cstdlib>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

namespace {

// The lead-out of discs of 74 and 80 minutes.
constexpr int32_t kShortDisc = 74 * 60 * kBlocksPerSecond, kLongDisc = 80 * 60 * kBlocksPerSecond;
constexpr int64_t kDataBlockBytes = 2048;
constexpr int kReadySeconds = 30; // for a medium to become usable

std::string toLower(std::string text) {
    std::transform(text.begin(), text.end(), text.begin(), [](unsigned char c) { return std::tolower(c); });
    return text;
}

std::string formatBlocks(int32_t blocks) {
    return formatDuration(static_cast<double>(blocks) / kBlocksPerSecond);
}

// The files of an audio CD, in the order of its tracks.
std::vector<SInputFile> listTracks(CLibrary& library, const SBurnOptions& options) {
    return listInputs(library, options.inputs, true, fs::path());
}

bool isSound(CLibrary& library, const fs::path& file) {
    std::error_code none;
    if (!fs::is_regular_file(file, none)) return false;
    std::string extension = toLower(file.extension());
    if (extension.empty()) return false;
    const std::u16string name(extension.begin() + 1, extension.end());
    return TONEWRIGHT_Host_GetPlugin(name.c_str(), TONEWRIGHT_AUDIO_SOURCE, nullptr) == 1;
}

EDiscContent chooseContent(CLibrary& library, const SBurnOptions& options) {
    if (!options.image.empty()) {
        const std::string extension = toLower(options.image.extension());
        if (extension != ".cue" && extension != ".iso")
            throw CUsageError(tr("host.Burn.imageType", "%FILE%: an image is a .cue or an .iso",
                                 {{"%FILE%", options.image.native()}}));
        const EDiscContent content = extension == ".cue" ? EDiscContent::audio : EDiscContent::data;
        if (options.content.value_or(content) != content)
            throw CUsageError(content == EDiscContent::audio
                                  ? tr("host.Burn.cueIsAudio", "A .cue is the image of an audio CD")
                                  : tr("host.Burn.isoIsData", "An .iso is the image of a data disc"));
        return content;
    }
    if (options.content) return *options.content;
    const bool isAudio = std::all_of(options.inputs.begin(), options.inputs.end(),
                                     [&](const fs::path& input) { return isSound(library, input); });
    return isAudio ? EDiscContent::audio : EDiscContent::data;
}

void requireEffect(const SBurnOptions& options, EDiscContent content) {
    const auto refuse = [](const char* option, const std::string& kind) {
        throw CUsageError(tr("host.Burn.noEffect", "%OPTION% has no effect on %KIND%",
                             {{"%OPTION%", option}, {"%KIND%", kind}}));
    };
    if (content == EDiscContent::data) {
        const std::string kind = tr("host.Burn.dataDisc", "a data disc");
        if (options.gap) refuse("--gap", kind);
        if (options.cdText) refuse("--cd-text", kind);
    } else if (!options.title.empty() && !options.cdText) {
        refuse("--title", tr("host.Burn.audioWithoutText", "an audio CD without --cd-text"));
    }
}

// A name may be longer than the title of a data disc, which has up to 32 bytes.
std::string cutTitle(std::string title) {
    size_t size = std::min<size_t>(title.size(), 32);
    while (size < title.size() && size > 0 && (title[size] & 0xC0) == 0x80) --size;
    title.resize(size);
    return title;
}

class CBurner {
public:
    CBurner(CLibrary& library, const SBurnOptions& options, EDiscContent content)
        : m_library(library), m_options(options), m_content(content), m_progress(options.show),
          m_target(options.image.empty() ? options.drive : options.image) {}

    int run();

private:
    bool prepareTracks(CBurnTracks& tracks, CDiscProject& project);
    void addFiles(CDiscProject& project);
    void findDrive();
    void checkTarget() const;
    void checkLength(const CDiscProject& project);
    bool write(CDiscProject& project);
    void finish(const CDiscProject& project);
    void failInput(const fs::path& input, const std::string& reason);

    CLibrary& m_library;
    const SBurnOptions& m_options;
    const EDiscContent m_content;
    CProgress m_progress;
    const fs::path m_target;
    CProgress::Job m_job = 0;
    std::chrono::steady_clock::time_point m_started;
    DiscHandle<DISCIO_Drive> m_drive; // empty for an image
    uint64_t m_files = 0;
    uint64_t m_bytes = 0; // of the files on a data disc
};

void CBurner::failInput(const fs::path& input, const std::string& reason) {
    m_progress.fail(m_progress.start(input, m_target, nlohmann::json::object()), reason);
}

void CBurner::findDrive() {
    if (m_options.drive.empty()) return;
    for (SDrive& drive : findDrives())
        if (isSameDrive(m_options.drive, drive.path)) m_drive = std::move(drive.handle);
    if (!m_drive) throw std::runtime_error(tr("host.Burn.noDrive", "There is no such drive"));
    for (int second = 0; getDiscFunctions().DriveCheckDisc(m_drive.get(), 1000, 0) != 1; ++second)
        if (second == kReadySeconds || isCancelled()) throw makeDiscError();
}

// The library would replace an existing image.
void CBurner::checkTarget() const {
    if (m_drive) return;
    std::vector<fs::path> files{m_target};
    if (m_content == EDiscContent::audio)
        for (const char* extension : {".bin", ".cdt"})
            files.push_back(fs::path(m_target).replace_extension(extension));
    for (const fs::path& file : files) {
        std::error_code none;
        if (!fs::exists(file, none)) continue;
        for (const fs::path& input : m_options.inputs)
            if (isSameFile(input, file))
                throw std::runtime_error(tr("host.sameFile", "Input and output are the same file"));
        if (m_options.force) continue;
        // The messages of the job begin with the name of the target.
        throw std::runtime_error(
            file == m_target
                ? tr("host.Burn.exists", "The file exists (--force replaces it)")
                : tr("host.existsForce", "%FILE% exists (--force replaces it)", {{"%FILE%", file.string()}}));
    }
}

// An image may be of any length, but a drive needs to have a disc for it.
void CBurner::checkLength(const CDiscProject& project) {
    if (m_content == EDiscContent::data) return;
    const int32_t blocks = project.getLengthBlocks();
    if (!m_drive) {
        if (blocks <= kShortDisc) return;
        return m_progress.warn(
            m_job,
            tr("host.Burn.longImage", "The tracks take %LENGTH%, more than the %MINUTES% minutes of a disc",
               {{"%LENGTH%", formatBlocks(blocks)}, {"%MINUTES%", blocks > kLongDisc ? "80" : "74"}}));
    }
    const SDiscFunctions& functions = getDiscFunctions();
    const DiscHandle<DISCIO_Disc> disc(functions.DriveOpenDisc(m_drive.get()));
    if (!disc) throw makeDiscError();
    const int64_t capacity = functions.DiscGetCapacityBytes(disc.get()) / kDataBlockBytes;
    if (capacity > 0 && blocks > capacity)
        throw std::runtime_error(
            tr("host.Burn.tooLong", "The tracks take %LENGTH%, but the disc holds %CAPACITY%",
               {{"%LENGTH%", formatBlocks(blocks)},
                {"%CAPACITY%", formatBlocks(static_cast<int32_t>(std::min<int64_t>(capacity, INT32_MAX)))}}));
}

// Reports every file that cannot become a track; false if there is one.
bool CBurner::prepareTracks(CBurnTracks& tracks, CDiscProject& project) {
    const std::vector<SInputFile> files = listTracks(m_library, m_options);
    constexpr size_t kMostTracks = 99;
    if (files.size() > kMostTracks)
        throw std::runtime_error(tr("host.Burn.tooMany", "An audio CD has at most 99 tracks, not %COUNT%",
                                    {{"%COUNT%", std::to_string(files.size())}}));
    bool isComplete = true;
    for (const SInputFile& file : files) {
        if (isCancelled()) return false;
        try {
            if (!file.problem.empty()) throw std::runtime_error(file.problem);
            tracks.add(m_library, project, file.file);
        } catch (const std::exception& failure) {
            failInput(file.file, failure.what());
            isComplete = false;
        }
    }
    if (!isComplete) return false;
    if (m_options.gap)
        for (int track = 1; track < project.getTrackCount(); ++track) project.setGap(track, *m_options.gap);
    if (m_options.cdText)
        for (const auto& [file, reason] : tracks.setTexts(project, m_options.title))
            m_progress.warn(m_job, file.string() + ": " + reason);
    return true;
}

void CBurner::addFiles(CDiscProject& project) {
    for (const SDiscFile& file : listDiscFiles(m_options.inputs, m_options.image)) {
        try {
            if (file.source.empty()) {
                project.addFolder(file.path);
                continue;
            }
            project.addFile(file.path, file.source);
            std::error_code none;
            m_bytes += fs::file_size(file.source, none);
            ++m_files;
        } catch (const std::exception& failure) {
            throw std::runtime_error(
                toPrintable((file.source.empty() ? file.path.back() : file.source.native())) + ": " +
                failure.what());
        }
    }
    if (!m_options.title.empty()) return project.setTitle(m_options.title);
    std::error_code none;
    const bool isFolder = m_options.inputs.size() == 1 && fs::is_directory(m_options.inputs.front(), none);
    std::string title = isFolder ? fs::canonical(m_options.inputs.front(), none).filename() : fs::path();
    if (title.empty()) title = m_options.image.stem();
    title = cutTitle(title);
    if (!title.empty()) project.setTitle(title);
}

bool CBurner::write(CDiscProject& project) {
    SWriteSettings settings{DISCIO_WRITE_VERIFY, m_options.speed};
    if (m_options.cdText) settings.flags |= DISCIO_WRITE_CD_TEXT;
    if (m_options.blank) settings.flags |= DISCIO_WRITE_BLANK;
    if (m_options.dummy) settings.flags = (settings.flags | DISCIO_WRITE_DUMMY) & ~DISCIO_WRITE_VERIFY;
    const CDiscProject::Progress advance = [&](double fraction) {
        m_progress.advance(m_job, fraction);
        return !isCancelled();
    };
    if (!m_drive) return project.writeImage(m_target, settings, advance);
    try {
        if (project.writeDisc(m_drive.get(), settings, advance)) return true;
        if (project.isPartlyWritten() && !m_options.dummy)
            m_progress.warn(m_job, tr("host.Burn.partlyWritten", "The disc is partly written"));
        return false;
    } catch (const std::exception&) { // its text says whether the disc is partly written
        if (m_options.blank || getDiscFunctions().GetLastError(nullptr) != DISCIO_ERROR_DISC_NOT_EMPTY) throw;
        throw std::runtime_error(
            tr("host.Burn.notEmpty", "The disc is not empty (--blank erases a rewritable disc)"));
    }
}

void CBurner::finish(const CDiscProject& project) {
    const std::chrono::duration<double> elapsed = std::chrono::steady_clock::now() - m_started;
    nlohmann::json details{{"seconds", elapsed.count()}, {"dummy", m_options.dummy}};
    const std::string target = toPrintable(m_target.native());
    if (m_content == EDiscContent::audio) {
        const int32_t blocks = project.getLengthBlocks();
        const int tracks = project.getTrackCount();
        details["tracks"] = tracks;
        details["duration"] = static_cast<double>(blocks) / kBlocksPerSecond;
        const std::initializer_list<STextValue> values{
            {"%TARGET%", target}, {"%TRACKS%", std::to_string(tracks)}, {"%DURATION%", formatBlocks(blocks)}};
        return m_progress.finish(
            m_job,
            tracks == 1
                ? tr("host.Burn.oneTrackDone", "%TARGET%: audio CD, 1 track, %DURATION%", values)
                : tr("host.Burn.audioDone", "%TARGET%: audio CD, %TRACKS% tracks, %DURATION%", values),
            details);
    }
    details["files"] = m_files;
    details["bytes"] = m_bytes;
    const std::initializer_list<STextValue> values{
        {"%TARGET%", target}, {"%FILES%", std::to_string(m_files)}, {"%SIZE%", formatSize(m_bytes)}};
    m_progress.finish(m_job,
                      m_files == 1
                          ? tr("host.Burn.oneFileDone", "%TARGET%: data disc, 1 file, %SIZE%", values)
                          : tr("host.Burn.dataDone", "%TARGET%: data disc, %FILES% files, %SIZE%", values),
                      details);
}

int CBurner::run() {
    m_started = std::chrono::steady_clock::now();
    m_job = m_progress.start(m_target, m_target,
                             {{"content", m_content == EDiscContent::audio ? "audio" : "data"}});
    try {
        findDrive();
        checkTarget();
        CBurnTracks tracks; // outlives the project, which reads their files
        CDiscProject project(m_content);
        bool isReady = true;
        if (m_content == EDiscContent::audio)
            isReady = prepareTracks(tracks, project);
        else
            addFiles(project);
        if (isReady && !isCancelled()) {
            checkLength(project);
            const bool done = write(project);
            for (const std::string& warning : tracks.takeWarnings()) m_progress.warn(m_job, warning);
            if (done) {
                finish(project);
                return kExitSuccess;
            }
        } else if (!isCancelled()) {
            throw std::runtime_error(tr("host.Burn.unready", "Nothing was written"));
        }
        m_progress.cancel(m_job);
        return kExitCancelled;
    } catch (const std::exception& failure) {
        if (isCancelled()) {
            m_progress.cancel(m_job);
            return kExitCancelled;
        }
        m_progress.fail(m_job, failure.what());
        return kExitFailure;
    }
}

} // namespace

int burn(CLibrary& library, const SBurnOptions& options) {
    const EDiscContent content = chooseContent(library, options);
    requireEffect(options, content);
    // Read whenever a conversion starts.
    ::setenv("TONEWRIGHT_RESAMPLER", "best", 0);
    return CBurner(library, options, content).run();
}

} // namespace host
