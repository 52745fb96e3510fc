// Finds a plug-in object that reads or writes a URI.
#pragma once

#include "sonora2/media/IAudioFormat.h"
#include "sonora2/media/IAudioSource.h"
#include "sonora2/media/IVideoSource.h"
#include "sonora2/plugins/ISonoraPlugin.h"
#include "sonora2/plugins/IVideoFormat.h"

namespace sonora2::common {

// The create calls try the plug-ins in order and return an empty handle if none fits; they throw CSonoraError
// only for an invalid parameter record. Calls are serialized, including the test opening.
class SONORA2_API IPluginHandler : public virtual peru::IBase {
public:
    using SSourceParams = ISonoraPlugin::SSourceParams;
    using SFormatParams = ISonoraPlugin::SFormatParams;
    using SObjectParams = ISonoraPlugin::SObjectParams;

    // One still of a video at a time in seconds.
    virtual P<ISonoraPicture> createPreviewImage(const P<peru::IURI>& uri, double time, int& width,
                                                 int& height) = 0;
    virtual P<ISource> createSource(const P<peru::IURI>& uri, const SSourceParams* params) = 0;
    virtual P<IVideoSource> createVideoSource(const P<peru::IURI>& uri, const SSourceParams* params) = 0;
    virtual P<IAudioSource> createAudioSource(const P<peru::IURI>& uri, const SSourceParams* params) = 0;
    virtual P<IAudioSource> createAudioSource(const P<peru::IURI>& uri, int rate, int channels,
                                              int bytesPerSample, bool keepOpened) = 0;
    virtual P<IFormat> createFormat(const P<peru::IURI>& uri, const SFormatParams* params) = 0;
    virtual P<IVideoFormat> createVideoFormat(const P<peru::IURI>& uri, const SFormatParams* params) = 0;
    virtual P<IAudioFormat> createAudioFormat(const P<peru::IURI>& uri, const SFormatParams* params) = 0;
    virtual P<IAudioFormat> createAudioFormat(const P<peru::IURI>& uri, int rate, int channels,
                                              int bytesPerSample) = 0;
    virtual P<peru::IBase> createObject(const P<peru::IURI>& uri, const SObjectParams* params) = 0;
    virtual P<IPluginExtensions> getValidExtensions(int mask) = 0;
    virtual void loadPlugin(const peru::CStringArg& name) = 0;
    virtual bool isBoxed() = 0;
    virtual int getPluginCount() = 0;
    virtual P<ISonoraPlugin> getPlugin(int index) = 0;
    // Whether a candidate is accepted only if it can be opened.
    virtual void setVerifyByOpening(bool verify) = 0;
    virtual bool getVerifyByOpening() = 0;
    // Suffix of temporary names; removed from a name before its extension is determined.
    virtual void setURISuffix(const peru::CStringArg& suffix) = 0;
    virtual P<peru::IString> getURISuffix() = 0;
    // The same plug-in as getPlugin, in this process in any case: for questions about types and extensions,
    // which should not start a process. Must not be used to create objects.
    virtual P<ISonoraPlugin> getPlainPlugin(int index) = 0;
};

} // namespace sonora2::common
