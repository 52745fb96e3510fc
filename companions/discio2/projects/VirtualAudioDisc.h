// An audio CD that is being composed.
#pragma once

#include "PcmStream.h"
#include "projects/VirtualDisc.h"

namespace discio {

class CVirtualAudioDisc : public CVirtualDisc {
public:
    struct SSegment {
        std::shared_ptr<IPcmStream> stream;
        int64_t frames = 0;
        int32_t pregap = 0;
        Texts texts = {};
    };

    const STableOfContents& getContents() const override { return m_contents; }
    SMediumState getState() const override;
    bool hasComponent(bool isAudio) const override { return isAudio; }
    std::unique_ptr<IAudioReader> createAudioReader(const STrack& track) const override;
    std::string getDataPath() const override;

    const std::vector<SSegment>& getSegments() const { return m_segments; }
    // These throw CDiscError and then change nothing. A place of -1 appends.
    void insert(const std::shared_ptr<IPcmStream>& stream, int32_t place);
    void remove(int32_t segment);
    void setPregap(int32_t segment, int32_t blocks);
    void setText(int32_t text, const std::string& value);
    void setSegmentText(int32_t segment, int32_t text, const std::string& value);

private:
    size_t requireSegment(int32_t segment) const;
    void replaceSegments(std::vector<SSegment> segments);

    std::vector<SSegment> m_segments;
    STableOfContents m_contents; // follows the segments
};

} // namespace discio
