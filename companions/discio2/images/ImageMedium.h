// A disc image as a medium.
#pragma once

#include "ImageLayout.h"

namespace discio {

class CImageMedium : public IMedium {
public:
    explicit CImageMedium(const std::string& path); // throws CDiscError

    const STableOfContents& getContents() const override { return m_layout.contents; }
    SMediumState getState() const override;
    std::unique_ptr<IAudioReader> createAudioReader(const STrack& track) const override;
    std::string getDataPath() const override;

    // Throws CDiscError.
    void readAudio(int32_t block, int32_t count, int16_t* samples) const;

private:
    const SExtent* findExtent(int32_t block) const;

    std::string m_path;
    SImageLayout m_layout;
};

} // namespace discio
