// The interface of a plug-in library.
#pragma once

#include "sonora2/media/IFormat.h"
#include "sonora2/media/ISource.h"

#include <cstddef>

namespace sonora2::common {

class ISonoraContext;

// Kinds of object a plug-in can create; bits of nTypes.
enum EPluginType : int {
    kVideoSource = 1,
    kAudioSource = 2,
    kImage = 4,
    kVideoFormat = 8,
    kAudioFormat = 16,
    kPluginObject = 64,
};

class SONORA2_API IPluginExtensions : public virtual peru::IBase {
public:
    virtual int getCount() const = 0;
    virtual P<peru::IString> getExtension(int index) const = 0; // lower case, without the dot
};

class SONORA2_API ISonoraPlugin : public virtual peru::IBase {
public:
    // Fixed records that also cross the pipe as raw bytes. The first field is the number of bytes the caller
    // filled: a receiver copies that many into a zeroed record of its own size, so that shorter records from
    // older callers stay valid.
    struct SSourceParams {
        int32_t nSize = sizeof(SSourceParams);
        uint8_t bKeepOpened = 0; // 0: closed again after the test opening
        uint8_t padding[3] = {};
        int32_t nSampleRate = 0;
        int32_t nChannelCount = 0;
        int32_t nBytesPerSample = 0;
    };
    struct SFormatParams {
        int32_t nSize = sizeof(SFormatParams);
        uint8_t video[92] = {}; // passed through unchanged; zero when an audio format is made
        int32_t nSampleRate = 0;
        int32_t nChannelCount = 0;
        int32_t nBytesPerSample = 0;
        uint8_t reserved[8] = {};
    };
    struct SObjectParams {
        int32_t nSize = sizeof(SObjectParams);
    };

    virtual P<peru::IString> getPluginName() = 0;
    virtual int getValidTypes() = 0;
    virtual P<IPluginExtensions> getValidExtensions(int nTypes) = 0;
    // Empty if the plug-in declines.
    virtual P<ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SSourceParams* pParams) = 0;
    virtual P<IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SFormatParams* pParams) = 0;
    virtual P<peru::IBase> tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) = 0;
};

static_assert(sizeof(ISonoraPlugin::SSourceParams) == 20);
static_assert(offsetof(ISonoraPlugin::SSourceParams, nSampleRate) == 8);
static_assert(sizeof(ISonoraPlugin::SFormatParams) == 116);
static_assert(offsetof(ISonoraPlugin::SFormatParams, nSampleRate) == 96);

// The function "sonora2_pluginCreate" that each plug-in library exports.
using PluginCreateFunction = void (*)(const P<ISonoraContext>& context, P<ISonoraPlugin>& plugin);
inline constexpr const char* kPluginCreateName = "sonora2_pluginCreate";

} // namespace sonora2::common
