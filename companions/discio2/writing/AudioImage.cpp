#include "images/ImageMedium.h"
#include "writing/CdTextPacks.h"
#include "writing/ImageWriter.h"
#include "writing/StagedFiles.h"

#include <algorithm>
#include <bit>
#include <cstdio>
#include <filesystem>
#include <zlib.h>

namespace discio {

namespace fs = std::filesystem;

namespace {

constexpr int32_t kBlocksAtOnce = kSectorsPerSecond;

// Calls `use` with all samples of a track, in portions of at most a second.
template <class Use> void readTrack(const IMedium& medium, const STrack& track, Use use) {
    const auto reader = medium.createAudioReader(track);
    std::vector<int16_t> samples(size_t{kBlocksAtOnce} * kAudioSectorBytes / 2);
    for (int32_t block = track.start; block < track.end();) {
        const int32_t count = std::min(kBlocksAtOnce, track.end() - block);
        reader->read(block, count, samples.data());
        block += count;
        use(samples.data(), static_cast<size_t>(count) * kAudioSectorBytes, block);
    }
}

void toLittleEndian(int16_t* samples, size_t bytes) {
    if constexpr (std::endian::native == std::endian::big)
        for (size_t i = 0; i < bytes / 2; ++i) {
            const auto value = static_cast<uint16_t>(samples[i]);
            samples[i] = static_cast<int16_t>(static_cast<uint16_t>(value << 8 | value >> 8));
        }
}

uLong addSum(uLong sum, const int16_t* samples, size_t bytes) {
    return crc32(sum, reinterpret_cast<const Bytef*>(samples), static_cast<uInt>(bytes));
}

std::string toTime(int32_t blocks) {
    char text[16];
    std::snprintf(text, sizeof text, "%02d:%02d:%02d", blocks / kSectorsPerSecond / 60,
                  blocks / kSectorsPerSecond % 60, blocks % kSectorsPerSecond);
    return text;
}

// A sheet has no way to write a quotation mark in a text.
std::string quote(std::string text) {
    std::replace(text.begin(), text.end(), '"', '\'');
    return '"' + text + '"';
}

class CSheet {
public:
    void addTexts(const Texts& texts, bool isDisc) {
        static constexpr std::pair<const char*, int> kCommands[] = {
            {"TITLE", DISCIO_TEXT_TITLE},           {"PERFORMER", DISCIO_TEXT_PERFORMER},
            {"SONGWRITER", DISCIO_TEXT_SONGWRITER}, {"COMPOSER", DISCIO_TEXT_COMPOSER},
            {"ARRANGER", DISCIO_TEXT_ARRANGER},     {"MESSAGE", DISCIO_TEXT_MESSAGE},
            {"DISC_ID", DISCIO_TEXT_DISC_ID},       {"GENRE", DISCIO_TEXT_GENRE},
        };
        for (const auto& [command, index] : kCommands)
            if (const std::string& text = texts[static_cast<size_t>(index)]; !text.empty())
                add(isDisc ? 0 : 4, std::string(command) + ' ' + quote(text));
    }
    void add(size_t indent, const std::string& line) { m_text += std::string(indent, ' ') + line + "\r\n"; }
    const std::string& getText() const { return m_text; }

private:
    std::string m_text;
};

std::string makeSheet(const STableOfContents& contents, const std::string& binName,
                      const std::string& packsName, bool withTexts) {
    CSheet sheet;
    if (!packsName.empty()) sheet.add(0, "CDTEXTFILE " + quote(packsName));
    const std::string& catalogue = contents.texts[DISCIO_TEXT_CODE];
    if (!catalogue.empty()) sheet.add(0, "CATALOG " + catalogue);
    if (withTexts) sheet.addTexts(contents.texts, true);
    sheet.add(0, "FILE " + quote(binName) + " BINARY");
    for (const STrack& track : contents.tracks) {
        sheet.add(2, "TRACK " + std::string(track.number < 10 ? "0" : "") + std::to_string(track.number) +
                         " AUDIO");
        if (withTexts) sheet.addTexts(track.texts, false);
        const std::string& code = track.texts[DISCIO_TEXT_CODE];
        if (!code.empty()) sheet.add(4, "ISRC " + code);
        if (track.number > 1 && track.pregap > 0)
            sheet.add(4, "INDEX 00 " + toTime(track.start - track.pregap));
        sheet.add(4, "INDEX 01 " + toTime(track.start));
    }
    return sheet.getText();
}

class CAudioImage {
public:
    CAudioImage(const CVirtualAudioDisc& disc, const std::string& path, const CProgress& progress)
        : m_disc(disc), m_progress(progress), m_staged(path) {
        const std::string stem = fs::path(m_staged.getName()).stem();
        if (stem.find_first_of("\"\r\n") != stem.npos)
            throw CDiscError(DISCIO_ERROR_INVALID_PARAM, path + " cannot be named in a cue sheet");
        m_bin = stem + ".bin";
        m_packs = stem + ".cdt";
    }

    void write(bool withTexts) {
        writeSamples();
        std::vector<std::string> names{m_bin, m_staged.getName()};
        const std::string packs = withTexts ? makePacks() : std::string();
        if (!packs.empty()) {
            writeSmall(m_packs, packs);
            names.insert(names.begin(), m_packs);
        }
        writeSmall(m_staged.getName(),
                   makeSheet(m_disc.getContents(), m_bin, packs.empty() ? "" : m_packs, withTexts));
        verify();
        m_staged.commit(names);
    }

private:
    // Packs add what the sheet cannot express; texts that do not fit into them are in the sheet only.
    std::string makePacks() const {
        try {
            return makeTextPacks(m_disc.getContents());
        } catch (const CDiscError& error) {
            if (error.getCode() != DISCIO_ERROR_NOT_SUPPORTED) throw;
        }
        return {};
    }

    void writeSmall(const std::string& name, const std::string& bytes) const {
        CNewFile file(m_staged.getPath(name));
        file.write(bytes.data(), bytes.size());
        file.finish();
    }

    void writeSamples() {
        CNewFile file(m_staged.getPath(m_bin));
        const STableOfContents& contents = m_disc.getContents();
        for (const STrack& track : contents.tracks) {
            if (track.number > 1) file.skip(int64_t{track.pregap} * kAudioSectorBytes);
            uLong sum = 0;
            readTrack(m_disc, track, [&](int16_t* samples, size_t bytes, int32_t end) {
                sum = addSum(sum, samples, bytes);
                toLittleEndian(samples, bytes);
                file.write(samples, bytes);
                m_progress.report(DISCIO_PHASE_WRITE, end, contents.leadOut);
            });
            m_sums.push_back(sum);
        }
        m_progress.report(DISCIO_PHASE_FINISH, 0.0);
        file.finish();
        m_progress.report(DISCIO_PHASE_FINISH, 1.0);
    }

    // Reads the image like any other.
    void verify() const {
        const std::string path = m_staged.getPath(m_staged.getName());
        const auto medium = std::make_shared<CImageMedium>(path);
        const STableOfContents &expected = m_disc.getContents(), &found = medium->getContents();
        const auto refuse = [&](const std::string& what) {
            throw CDiscError(DISCIO_ERROR_DEVICE,
                             m_staged.getName() + ": " + what + " differs from what was written");
        };
        if (found.leadOut != expected.leadOut || found.tracks.size() != expected.tracks.size())
            refuse("the table of contents");
        for (size_t i = 0; i < found.tracks.size(); ++i) {
            const STrack &track = found.tracks[i], &own = expected.tracks[i];
            const std::string name = "track " + std::to_string(track.number);
            if (track.start != own.start || track.length != own.length || track.pregap != own.pregap)
                refuse("the place of " + name);
            uLong sum = 0;
            readTrack(*medium, track, [&](const int16_t* samples, size_t bytes, int32_t end) {
                sum = addSum(sum, samples, bytes);
                m_progress.report(DISCIO_PHASE_VERIFY, end, expected.leadOut);
            });
            if (sum != m_sums[i]) refuse(name);
        }
    }

    const CVirtualAudioDisc& m_disc;
    const CProgress& m_progress;
    CStagedFiles m_staged;
    std::string m_bin;
    std::string m_packs;
    std::vector<uLong> m_sums; // of the tracks' samples
};

} // namespace

void writeAudioImage(const CVirtualAudioDisc& disc, const std::string& path, bool withTexts,
                     const CProgress& progress) {
    requireExtension(path, ".cue");
    if (disc.getSegments().empty()) throw CDiscError(DISCIO_ERROR_DISC_EMPTY, "the project has no tracks");
    progress.report(DISCIO_PHASE_PREPARE, 0.0);
    CAudioImage(disc, path, progress).write(withTexts);
}

} // namespace discio
