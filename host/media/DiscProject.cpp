#include "media/DiscProject.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Disc.h"

#include <algorithm>
#include <cmath>
#include <tonewright/host.h>

namespace host {

namespace {

std::u16string requireUTF16(const std::string& text) {
    if (auto wide = toUTF16(text)) return *wide;
    throw std::runtime_error(
        tr("host.Burn.notUTF8", "%NAME%: the name is not valid UTF-8", {{"%NAME%", toPrintable(text)}}));
}

void require(int32_t result) {
    if (result != 1) throw makeDiscError();
}

// A text on a disc has at most 160 characters, none of them a control character.
std::u16string toDiscText(const std::string& text) {
    constexpr size_t kMost = 160;
    std::u16string wide = toUTF16(text).value_or(u"");
    for (char16_t& c : wide)
        if (c < 0x20 || (c >= 0x7F && c < 0xA0)) c = u' ';
    if (wide.size() > kMost) wide.resize(kMost);
    if (!wide.empty() && (wide.back() & 0xFC00) == 0xD800) wide.pop_back(); // half a surrogate pair
    return wide;
}

std::u16string toDiscPath(const CDiscProject::Path& path) {
    std::u16string text;
    for (const std::string& name : path) text += (text.empty() ? u"" : u"\\") + requireUTF16(name);
    return text;
}

} // namespace

struct CDiscProject::SRunning {
    const Progress& progress;
    double fraction = 0;
    bool stopped = false;
    bool isWriting = false;

    // The phases take about these parts of the time.
    static int32_t advance(void* user, int32_t phase, double fraction) {
        static constexpr double kStarts[] = {0.0, 0.02, 0.1, 0.8, 0.82, 1.0};
        auto& running = *static_cast<SRunning*>(user);
        const size_t at = static_cast<size_t>(std::clamp<int32_t>(phase, 0, DISCIO_PHASE_VERIFY));
        const double whole = kStarts[at] + (kStarts[at + 1] - kStarts[at]) * std::clamp(fraction, 0.0, 1.0);
        running.fraction = std::max(running.fraction, whole);
        running.stopped = running.stopped || !running.progress(running.fraction);
        // The first report of the phase comes before the drive writes, so stopping there spares the medium.
        if (!running.stopped)
            running.isWriting =
                phase == DISCIO_PHASE_WRITE || (phase == DISCIO_PHASE_FINISH && fraction < 1.0);
        return running.stopped ? 0 : 1;
    }
};

CDiscProject::CDiscProject(EDiscContent content) {
    const SDiscFunctions& functions = getDiscFunctions();
    clearFailure();
    m_handle = CHandle(content == EDiscContent::audio ? TONEWRIGHT_Host_CreateAudioCDProject()
                                                      : TONEWRIGHT_Host_CreateDataDiscProject());
    m_project = m_handle ? TONEWRIGHT_Host_GetDiscProject(m_handle.get()) : nullptr;
    if (!m_project) throw std::runtime_error(takeFailure(tr("host.unknown", "unknown")));
    m_disc.reset(functions.ProjectGetVirtualDisc(m_project));
    if (!m_disc) throw makeDiscError();
}

void CDiscProject::addTrack(CLibrary& library, const CHandle& source) {
    const int before = getTrackCount();
    clearFailure();
    const int32_t result = library.AudioCDProject_AddTrackFromAudioSource(m_handle.get(), source.get(), -1);
    // The export also reports success for a source that cannot be opened.
    if (result != TONEWRIGHT_OK || getTrackCount() != before + 1)
        throw std::runtime_error(
            takeFailure(tr("host.Burn.refused", "The file cannot become a track of an audio CD")));
}

void CDiscProject::setGap(int track, double seconds) {
    const auto blocks = static_cast<int32_t>(std::lround(seconds * kBlocksPerSecond));
    require(getDiscFunctions().DiscAudioSetSegmentPregap(m_disc.get(), track, blocks));
}

void CDiscProject::setText(int track, int32_t text, const std::string& value) {
    const SDiscFunctions& functions = getDiscFunctions();
    const std::u16string wide = toDiscText(value);
    require(track < 0
                ? functions.DiscAudioSetMetaDataStringW(m_disc.get(), text, wide.c_str())
                : functions.DiscAudioSetSegmentMetaDataStringW(m_disc.get(), track, text, wide.c_str()));
}

int CDiscProject::getTrackCount() const {
    return getDiscFunctions().DiscGetTrackCount(m_disc.get());
}

int32_t CDiscProject::getLengthBlocks() const {
    return getDiscFunctions().DiscGetTrackStartBlocks(m_disc.get(), getTrackCount());
}

void CDiscProject::setTitle(const std::string& title) {
    require(getDiscFunctions().DiscDataSetTitleW(m_disc.get(), requireUTF16(title).c_str()));
}

void CDiscProject::addFolder(const Path& path) {
    require(getDiscFunctions().DiscDataCreateFolderW(m_disc.get(), toDiscPath(path).c_str()));
}

void CDiscProject::addFile(const Path& path, const std::filesystem::path& source) {
    require(
        getDiscFunctions().DiscDataAddFileW(m_disc.get(), toDiscPath(path).c_str(), toURI(source).c_str()));
}

template <class Write>
bool CDiscProject::write(const SWriteSettings& settings, const Progress& progress, Write&& write) {
    const SDiscFunctions& functions = getDiscFunctions();
    SRunning running{progress};
    const DISCIO_WriteOptions options{sizeof options, settings.flags, settings.speed, &SRunning::advance,
                                      &running};
    clearFailure();
    const bool isDone = write(functions, options) == 1;
    m_isPartlyWritten = !isDone && running.isWriting;
    if (isDone) return true;
    if (running.stopped) return false;
    const std::runtime_error failure = makeDiscError();
    // The reason why a source could not be read is known to the library that reads it.
    if (functions.GetLastError(nullptr) == DISCIO_ERROR_READ_INPUT)
        throw std::runtime_error(takeFailure(failure.what()));
    throw failure;
}

bool CDiscProject::writeImage(const std::filesystem::path& image, const SWriteSettings& settings,
                              const Progress& progress) {
    const std::u16string path = requireUTF16(std::filesystem::absolute(image).native());
    return write(settings, progress,
                 [&](const SDiscFunctions& functions, const DISCIO_WriteOptions& options) {
                     return functions.ProjectWriteImageW(m_project, path.c_str(), &options);
                 });
}

bool CDiscProject::writeDisc(DISCIO_Drive* drive, const SWriteSettings& settings, const Progress& progress) {
    return write(settings, progress,
                 [&](const SDiscFunctions& functions, const DISCIO_WriteOptions& options) {
                     return functions.ProjectWriteDisc(m_project, drive, &options);
                 });
}

} // namespace host
