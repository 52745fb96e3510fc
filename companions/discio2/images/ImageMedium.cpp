#include "ImageMedium.h"

#include <algorithm>
#include <bit>
#include <cstring>

namespace discio {

namespace {

void swapBytes(int16_t* samples, size_t count) {
    for (size_t i = 0; i < count; ++i) {
        const auto value = static_cast<uint16_t>(samples[i]);
        samples[i] = static_cast<int16_t>(static_cast<uint16_t>(value << 8 | value >> 8));
    }
}

class CImageAudioReader : public IAudioReader {
public:
    explicit CImageAudioReader(std::shared_ptr<const CImageMedium> medium) : m_medium(std::move(medium)) {}
    void read(int32_t block, int32_t count, int16_t* samples) override {
        m_medium->readAudio(block, count, samples);
    }
    int64_t getRepairs() const override { return 0; }

private:
    std::shared_ptr<const CImageMedium> m_medium;
};

class CImageDataReader : public IDataReader {
public:
    explicit CImageDataReader(std::shared_ptr<const CImageMedium> medium) : m_medium(std::move(medium)) {}
    void read(int32_t block, int32_t count, void* to) override {
        for (int32_t i = 0; i < count; ++i)
            m_medium->readData(block + i, static_cast<char*>(to) + int64_t{i} * kDataSectorBytes);
    }
    std::string getName() const override { return m_medium->getPath(); }

private:
    std::shared_ptr<const CImageMedium> m_medium;
};

} // namespace

CImageMedium::CImageMedium(const std::string& path) : m_path(path), m_layout(readImage(path)) {}

SMediumState CImageMedium::getState() const {
    constexpr int32_t kLargestCd = 100 * 60 * kSectorsPerSecond;
    SMediumState state;
    state.type = m_layout.contents.leadOut <= kLargestCd ? EMediumType::cdRom : EMediumType::dvdRom;
    state.capacityBytes = int64_t{m_layout.contents.leadOut} * kDataSectorBytes;
    return state;
}

std::unique_ptr<IAudioReader> CImageMedium::createAudioReader(const STrack&) const {
    return std::make_unique<CImageAudioReader>(
        std::static_pointer_cast<const CImageMedium>(shared_from_this()));
}

const SExtent* CImageMedium::findExtent(int32_t block) const {
    const auto behind =
        std::upper_bound(m_layout.extents.begin(), m_layout.extents.end(), block,
                         [](int32_t value, const SExtent& extent) { return value < extent.start; });
    if (behind == m_layout.extents.begin()) return nullptr;
    const SExtent& extent = *(behind - 1);
    return block < extent.start + extent.count ? &extent : nullptr;
}

void CImageMedium::readAudio(int32_t block, int32_t count, int16_t* samples) const {
    while (count > 0) {
        const SExtent* extent = findExtent(block);
        if (!extent || !isAudioForm(extent->form))
            throw CDiscError(DISCIO_ERROR_NO_AUDIO,
                             m_path + " has no audio in block " + std::to_string(block));
        const int32_t some = std::min(count, extent->start + extent->count - block);
        const size_t wanted = static_cast<size_t>(some) * kAudioSectorBytes;
        size_t got = 0;
        const int64_t index = block - extent->start;
        if (extent->form == ESectorForm::audioWithSub) {
            const int step = getSectorBytes(extent->form);
            for (int32_t i = 0; i < some; ++i, got += kAudioSectorBytes) {
                char* to = reinterpret_cast<char*>(samples) + got;
                const size_t part = m_layout.files[static_cast<size_t>(extent->file)]->read(
                    extent->offset + (index + i) * step, to, kAudioSectorBytes);
                std::memset(to + part, 0, kAudioSectorBytes - part);
            }
        } else if (extent->form != ESectorForm::silence) {
            const int64_t at = index * kAudioSectorBytes;
            const int64_t available =
                std::clamp<int64_t>(extent->bytes - at, 0, static_cast<int64_t>(wanted));
            got = m_layout.files[static_cast<size_t>(extent->file)]->read(extent->offset + at, samples,
                                                                          static_cast<size_t>(available));
        }
        std::memset(reinterpret_cast<char*>(samples) + got, 0, wanted - got);
        if ((extent->form == ESectorForm::audioSwapped) == (std::endian::native == std::endian::little))
            swapBytes(samples, wanted / 2);
        samples += wanted / 2;
        block += some;
        count -= some;
    }
}

void CImageMedium::readData(int32_t block, char* to) const {
    const SExtent* extent = findExtent(block);
    if (!extent || isAudioForm(extent->form) || extent->file < 0)
        throw CDiscError(DISCIO_ERROR_NO_DATA, m_path + " has no data in block " + std::to_string(block));
    const CImageFile& file = *m_layout.files[static_cast<size_t>(extent->file)];
    const int64_t offset = extent->offset + int64_t{block - extent->start} * getSectorBytes(extent->form);
    constexpr int kMode = 15, kHeader = 16, kSubheader = 8;
    int inside = 0;
    if (extent->form == ESectorForm::withSubheader) {
        inside = kSubheader;
    } else if (extent->form != ESectorForm::data) {
        char header[kHeader];
        if (file.read(offset, header, kHeader) < kHeader) header[kMode] = 0;
        inside = kHeader + (header[kMode] == 2 ? kSubheader : 0);
    }
    if (file.read(offset + inside, to, kDataSectorBytes) < kDataSectorBytes)
        throw CDiscError(DISCIO_ERROR_READ_INPUT, file.getPath() + " is too short");
}

std::string CImageMedium::getDataPath() const {
    const STrack* track = findDataTrack();
    if (!track) throw CDiscError(DISCIO_ERROR_NO_DATA, m_path + " has no data track");
    const SExtent* extent = findExtent(track->start);
    const bool isWhole = extent && extent->file >= 0 && extent->offset == 0 && extent->start == track->start;
    return isWhole ? m_layout.files[static_cast<size_t>(extent->file)]->getPath() : std::string();
}

std::unique_ptr<IDataReader> CImageMedium::createDataReader() const {
    return std::make_unique<CImageDataReader>(
        std::static_pointer_cast<const CImageMedium>(shared_from_this()));
}

} // namespace discio
