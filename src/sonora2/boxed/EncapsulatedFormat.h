// A format in a slave process, for callers that need not know.
#pragma once

#include "peru/IInterfaceQuery.h"
#include "peru/Object.h"
#include "sonora2/boxed/BoxedMedia.h"
#include "sonora2/boxed/FormatClient.h"
#include "sonora2/boxed/SlaveFiles.h"

#include <array>
#include <optional>

namespace sonora2::common {

// Starts a slave with the first open(), which it has for itself until it is destroyed. The interface cast
// finds the optional interfaces that the format in the slave has.
//
// Writing does not wait for the slave: an error is thrown by one of the next calls, at the latest by close().
// If the slave dies, the next call throws, and discard() removes the file that the slave has begun.
class SONORA2_API CEncapsulatedFormat : public peru::CObject,
                                        public IVideoFormat,
                                        public IAudioFormat,
                                        public peru::IInterfaceQuery,
                                        private TBoxedMedia<CFormatClient> {
public:
    using SFormatParams = ISonoraPlugin::SFormatParams;

    CEncapsulatedFormat(const P<ISonoraContext>& context, const P<peru::IString>& pluginName,
                        const P<peru::IURI>& uri, int types, const SFormatParams* params);
    ~CEncapsulatedFormat() override; // closes; errors are ignored

    // Creates the format in a slave now. Returns false if the plug-in declines.
    bool prepare();

    bool isOpened() override;
    void open() override;
    void close() override;
    P<peru::IURI> getURI() override { return m_uri; }
    P<peru::IString> getPluginName() override { return m_pluginName; }
    int64_t getEstimatedSizeBytes(double fDuration) override;

    SFormatParams getVideoParameter() override;
    void writeFrame(const P<ISonoraPicture>& pPicture) override;
    int getWantedImageType() override;

    int getSampleRate() override;
    int getChannelCount() override;
    int getBytesPerSample() override;
    void setAudioQuality(double fQuality) override;
    void setAudioBitRate(int nNominal, int nMin, int nMax) override;
    void writeAudioChunk(const P<audio::IAudioChunk>& pAudioChunk) override;

    peru::SInterfaceQueryResult queryInterface(const std::type_info& wanted) override;

private:
    class CDiscardable;
    class CFloatSamples;
    class CFormatSettings;

    bool has(ERemoteFacet facet) const { return (m_state->facets & facet) != 0; }
    void applySettings(CFormatClient& client);
    // Waits for the slave if the write is `isDoubtful`: likely to fail for a reason that the caller can mend.
    template <class Write> void write(const char* operation, bool isDoubtful, Write write);
    void discard() noexcept;

    int m_types;
    SFormatParams m_params;

    // Guarded by the lock of the slave.
    std::optional<double> m_quality;
    std::optional<std::array<int, 3>> m_bitRate;
    bool m_isApplied = false;                          // the settings above, in the slave's format
    std::chrono::steady_clock::time_point m_lastCheck; // for errors of writing
    CUnfinishedOutput m_output;
};

} // namespace sonora2::common
