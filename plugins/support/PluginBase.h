// Base class of the plug-in object that a plug-in library exports.
#pragma once

#include "sonora2/context/ISonoraContext.h"
#include "sonora2/plugins/ISonoraPlugin.h"
#include "support/Decoder.h"
#include "support/EncoderFormat.h"

#include <memory>
#include <string>
#include <vector>

namespace sonora2::plugins {

using Extensions = std::vector<std::string>; // lower case, without the dot

// A plug-in for sound files. The author overrides one or both factories:
//
//   class CMyPlugin : public CPluginBase {
//   public:
//       explicit CMyPlugin(const P<common::ISonoraContext>& context)
//           : CPluginBase(context, "sonora2_my", {"my"}, {"my"}) {}
//   protected:
//       std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file) override;
//       CEncoderFormat::EncoderFactory getEncoderFactory() override;
//   };
//   SONORA2_PLUGIN(CMyPlugin)
//
// Declines requests that are not for audio or not for a local file.
class CPluginBase : public peru::CObject, public common::ISonoraPlugin {
public:
    P<peru::IString> getPluginName() override { return m_name; }
    int getValidTypes() override;
    P<common::IPluginExtensions> getValidExtensions(int nTypes) override;
    // If parameters are given, the source is opened to check whether they can be met, and stays open if
    // bDontCloseAfterTesting is set. Throws the reason if the file cannot be read in the requested format.
    P<common::ISource> tryCreateSource(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SSourceParams* pParams) override;
    // Throws the reason if the format cannot be written.
    P<common::IFormat> tryCreateFormat(const P<peru::IURI>& uri, int nTypes, bool bDontCloseAfterTesting,
                                       const SFormatParams* pParams) override;
    P<peru::IBase> tryCreateObject(const P<peru::IURI>& uri, const SObjectParams* pParams) override;

protected:
    CPluginBase(const P<common::ISonoraContext>& context, const char* name, Extensions readExtensions,
                Extensions writeExtensions);
    ~CPluginBase() override;

    // Returns null if the plug-in does not read this file. Must not open it.
    virtual std::unique_ptr<IDecoder> createDecoder(const SMediaFile& file);
    // Returns null if the plug-in does not write.
    virtual CEncoderFormat::EncoderFactory getEncoderFactory();
    // Whether the URI is supported at all; by default, local files are.
    virtual bool serves(const SMediaFile& file);

    const P<common::ISonoraContext>& getContext() const { return m_context; }

private:
    P<common::ISonoraContext> m_context;
    P<peru::IString> m_name;
    Extensions m_readExtensions;
    Extensions m_writeExtensions;
};

// Defines the entry point of a plug-in library. Exceptions do not cross it: if construction fails, the
// plug-in is empty.
#define SONORA2_PLUGIN(Class)                                                                                \
    extern "C" __attribute__((visibility("default"))) void sonora2_pluginCreate(                             \
        const ::peru::P<::sonora2::common::ISonoraContext>& context,                                         \
        ::peru::P<::sonora2::common::ISonoraPlugin>& plugin) {                                               \
        try {                                                                                                \
            plugin = ::peru::make<Class>(context);                                                           \
        } catch (...) {                                                                                      \
            plugin.reset();                                                                                  \
        }                                                                                                    \
    }                                                                                                        \
    static_assert(true)

} // namespace sonora2::plugins
