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
    std::unique_ptr<IDataReader> createDataReader() const override;

    // Throws CDiscError.
    void readAudio(int32_t block, int32_t count, int16_t* samples) const;
    void readData(int32_t block, char* to) const; // one block
    const std::string& getPath() const { return m_path; }

private:
    const SExtent* findExtent(int32_t block) const;

    std::string m_path;
    SImageLayout m_layout;
};

} // namespace discio
