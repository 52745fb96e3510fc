#include "media/DiscToc.h"

#include "base/Translation.h"
#include "library/Failure.h"
#include "media/Disc.h"
#include "media/Playlist.h"
#include "media/SoundFile.h"

#include <algorithm>
#include <cctype>
#include <charconv>
#include <cmath>
#include <optional>
#include <stdexcept>
#include <tonewright/host.h>

namespace host {

namespace fs = std::filesystem;

namespace {

constexpr int32_t kPregap = 150;
constexpr int64_t kMostFrames = 100 * 3600 * kCueFrames;

int32_t toFrame(int64_t frames) {
    if (frames > kMostFrames)
        throw std::runtime_error(tr("host.Toc.tooLong", "The tracks are too long for a disc"));
    return static_cast<int32_t>(frames);
}

} // namespace

SDiscToc parseDiscToc(const std::string& text) {
    SDiscToc toc;
    for (size_t at = 0; (at = text.find_first_not_of(" \t,", at)) != std::string::npos;) {
        const size_t end = std::min(text.find_first_of(" \t,", at), text.size());
        int32_t number = 0;
        const auto [stop, error] = std::from_chars(text.data() + at, text.data() + end, number);
        if (error != std::errc() || stop != text.data() + end || number < 0)
            throw std::invalid_argument(tr("host.Toc.noNumber", "%TEXT% is not a number of frames",
                                           {{"%TEXT%", text.substr(at, end - at)}}));
        toc.offsets.push_back(number);
        at = end;
    }
    if (toc.offsets.size() < 2)
        throw std::invalid_argument(tr("host.Toc.few", "needs a track and the lead-out at least"));
    toc.leadOut = toc.offsets.back();
    toc.offsets.pop_back();
    for (size_t i = 0; i < toc.offsets.size(); ++i)
        if (toc.offsets[i] >= (i + 1 < toc.offsets.size() ? toc.offsets[i + 1] : toc.leadOut))
            throw std::invalid_argument(tr("host.Toc.ascend", "must ascend"));
    if (toc.offsets.size() > 99) throw std::invalid_argument(tr("host.Toc.many", "has more than 99 tracks"));
    return toc;
}

SDiscToc readCueToc(const fs::path& sheet) {
    SDiscToc toc;
    fs::path file;
    int64_t fileStart = kPregap, fileFrames = 0;
    for (const SPlayItem& item : listItems({sheet}, {}, false)) {
        if (!item.failure.empty()) throw std::runtime_error(item.failure);
        if (item.track == 0) throw std::runtime_error(tr("host.Toc.noSheet", "Is not a cue sheet"));
        if (item.file != file) {
            file = item.file;
            fileStart += fileFrames;
            const SSoundFile sound = openSoundFile(file);
            // A disc has whole frames only.
            fileFrames = std::llround(std::ceil(sound.info.duration * kCueFrames - 1e-6));
        }
        toc.offsets.push_back(toFrame(fileStart + item.begin));
    }
    toc.leadOut = toFrame(fileStart + fileFrames);
    getDiscId(toc);
    return toc;
}

SDiscToc readToc(const CDisc& disc) {
    SDiscToc toc;
    for (const SDiscTrack& track : disc.getTracks()) toc.offsets.push_back(track.start + kPregap);
    if (toc.offsets.empty())
        throw std::runtime_error(tr("host.Toc.empty", "%FILE% has no tracks", {{"%FILE%", disc.getPlace()}}));
    toc.leadOut = disc.getLeadOut() + kPregap;
    return toc;
}

SDiscToc findToc(const fs::path& place) {
    std::string extension = place.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    // The image reader takes only sheets whose files have the samples of a disc.
    if (extension == ".cue") {
        try {
            return readCueToc(place);
        } catch (const std::runtime_error&) {
            std::optional<CDisc> image;
            try {
                image.emplace(place);
            } catch (const std::runtime_error&) {
            }
            if (!image) throw;
            return readToc(*image);
        }
    }
    return readToc(CDisc(place));
}

uint32_t getDiscId(const SDiscToc& toc) {
    uint32_t id = 0;
    clearFailure();
    if (TONEWRIGHT_Host_GetCDDBDiscId(toc.offsets.data(), static_cast<int32_t>(toc.offsets.size()),
                                      toc.leadOut, &id) != 1)
        throw std::runtime_error(tr("host.Toc.disorder", "The tracks do not ascend"));
    return id;
}

} // namespace host
