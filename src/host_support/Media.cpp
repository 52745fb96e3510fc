// Queries the plug-ins for the properties of files and the capabilities of targets.
#include "host_support/Guard.h"
#include "host_support/WriterQuestions.h"
#include "peru/strings/LocalizedFormat.h"
#include "sonora2/boxed/PluginModuleBoxed.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/CloseGuard.h"
#include "sonora2/media/IClippingPrevention.h"
#include "sonora2/media/IFormatSettings.h"
#include "sonora2/media/IMediaDescription.h"
#include "sonora2/media/ISalvage.h"
#include "sonora2/plugins/MediaEnvironment.h"
#include "sonora2/plugins/PluginExtensions.h"

using namespace tonewright::host_support;
using namespace sonora2::common;
using peru::CString;

namespace {

P<IPluginHandler> requireHandler(const P<IPluginHandler>& handler) {
    if (!handler)
        throw peru::CError(peru::localize("tonewright.Media.notStarted", "The library is not started"));
    return handler;
}

// Calls `ask` with each plug-in of that type for the file's extension, until it returns true.
template <class Ask>
bool askPlugins(const P<peru::IURI>& uri, const P<IPluginHandler>& handler, int type, Ask ask) {
    const P<peru::IString> wanted = getLookupKey(uri, handler->getURISuffix());
    for (int i = 0; i < handler->getPluginCount(); ++i) {
        const P<ISonoraPlugin> plugin = handler->getPlugin(i);
        const P<IPluginExtensions> extensions = handler->getPlainPlugin(i)->getValidExtensions(type);
        for (int k = 0; extensions && k < extensions->getCount(); ++k) {
            if (!extensions->getExtension(k)->equals(wanted)) continue;
            if (ask(*plugin)) return true;
            break;
        }
    }
    return false;
}

[[noreturn]] void failWithoutPlugin(const P<peru::IURI>& uri, IPluginHandler& handler,
                                    const peru::SLocalizedText& byExtension,
                                    const peru::SLocalizedText& withoutExtension) {
    const P<peru::IString> extension = getLookupKey(uri, handler.getURISuffix());
    throw CSonoraError(extension->isEmpty() ? peru::format(withoutExtension)
                                            : peru::format(byExtension, extension));
}

[[noreturn]] void failWithoutReader(const P<peru::IURI>& uri, IPluginHandler& handler) {
    failWithoutPlugin(
        uri, handler, {"tonewright.Media.noReader", "No plug-in reads .%s files"},
        {"tonewright.Media.noReaderWithoutExtension", "No plug-in reads files without an extension"});
}

[[noreturn]] void failWithoutWriter(const P<peru::IURI>& uri, IPluginHandler& handler) {
    failWithoutPlugin(
        uri, handler, {"tonewright.Media.noWriter", "No plug-in writes .%s files"},
        {"tonewright.Media.noWriterWithoutExtension", "No plug-in writes files without an extension"});
}

// An open source in the file's own format. Throws the reason of the first plug-in that failed.
P<IAudioSource> openMedia(const P<peru::IURI>& uri) {
    const P<IPluginHandler> handler = requireHandler(getMediaEnvironment().readHandler);
    P<IAudioSource> source;
    P<peru::CException> reason;
    const bool isOpen = askPlugins(uri, handler, kAudioSource, [&](ISonoraPlugin& plugin) {
        try {
            source =
                peru::interfaceCast<IAudioSource>(plugin.tryCreateSource(uri, kAudioSource, true, nullptr));
            if (source) source->open();
            return source != nullptr;
        } catch (const peru::CException& exception) {
            if (!reason) reason = exception.clone();
            return false;
        }
    });
    if (isOpen) return source;
    if (reason) reason->raise();
    failWithoutReader(uri, *handler);
}

void fillInfo(const P<IAudioSource>& source, TONEWRIGHT_MediaInfo* info) {
    if (!info) return;
    TONEWRIGHT_MediaInfo values = {};
    values.sampleRate = source->getSampleRate();
    values.channelCount = source->getChannelCount();
    values.bytesPerSample = source->getBytesPerSample();
    values.duration = source->getDuration();
    copyText(values.plugin, CString::toStdString(source->getPluginName()));
    if (const auto description = peru::interfaceCast<IMediaDescription>(source)) {
        values.sampleRate = description->getOwnSampleRate();
        values.channelCount = description->getOwnChannelCount();
        values.bytesPerSample = description->getOwnBytesPerSample();
        values.bitRate = description->getBitRate();
        copyText(values.codec, CString::toStdString(description->getCodecName()));
    }
    fillRecord(info, values);
}

// The settings that are used by the format of the first plug-in for the file that accepts these numbers;
// empty if there is none. The reasons of those that do not are ignored.
std::optional<uint32_t> findFormat(CWriterQuestions& questions, const P<peru::IURI>& uri,
                                   const P<IPluginHandler>& handler, int rate, int channels, int bytes) {
    static_assert(static_cast<int>(TONEWRIGHT_SETTING_QUALITY) == IFormatSettings::kQuality &&
                  static_cast<int>(TONEWRIGHT_SETTING_BIT_RATE) == IFormatSettings::kBitRate &&
                  static_cast<int>(TONEWRIGHT_SETTING_WIDTH) == IFormatSettings::kSampleWidth);
    std::optional<uint32_t> settings;
    askPlugins(uri, handler, kAudioFormat, [&](ISonoraPlugin& plugin) {
        settings = questions.ask(plugin, rate, channels, bytes);
        return settings.has_value();
    });
    return settings;
}

} // namespace

TONEWRIGHT_Handle TONEWRIGHT_Host_OpenMedia(const char16_t* uri, TONEWRIGHT_MediaInfo* info) {
    return guard<TONEWRIGHT_Handle>(nullptr, [&] {
        const P<IAudioSource> source = openMedia(tonewright::exports::toURI(uri));
        fillInfo(source, info);
        return wrap(source);
    });
}

int32_t TONEWRIGHT_Host_GetMediaInfo(TONEWRIGHT_Handle source, TONEWRIGHT_MediaInfo* info) {
    return guard(0, [&] {
        const P<IAudioSource> object = require<IAudioSource>(source, "an audio source");
        const bool wasOpened = object->isOpened();
        if (!wasOpened) object->open();
        const CCloseGuard closing(*object, !wasOpened);
        fillInfo(object, info);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetSourceFormat(TONEWRIGHT_Handle source, int32_t sampleRate, int32_t channelCount,
                                        int32_t bytesPerSample) {
    return guard(0, [&] {
        if (sampleRate <= 0 || channelCount <= 0 || bytesPerSample <= 0 || bytesPerSample > 4)
            throw peru::CError(
                peru::localize("tonewright.Media.format", "The numbers are not a sound format"));
        require<IMediaDescription>(source, "a source of a file")
            ->setDeliveredFormat(sampleRate, channelCount, bytesPerSample);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetSalvage(TONEWRIGHT_Handle source, int32_t salvage) {
    return guard(0, [&] {
        require<ISalvage>(source, "a source that can be salvaged")->setSalvage(salvage != 0);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_SetClippingPrevention(TONEWRIGHT_Handle source, int32_t prevent) {
    return guard(0, [&] {
        require<IClippingPrevention>(source, "a source that can prevent clipping")
            ->setClippingPrevention(prevent != 0);
        return 1;
    });
}

char* TONEWRIGHT_Host_TakeWarnings(TONEWRIGHT_Handle source) {
    return guard<char*>(nullptr, [&]() -> char* {
        const P<IMediaDescription> description = unwrap<IMediaDescription>(source);
        const std::string lines =
            description ? CString::toStdString(description->takeWarnings()) : std::string();
        return lines.empty() ? nullptr : ::strdup(lines.c_str());
    });
}

int32_t TONEWRIGHT_Host_GetPlugin(const char16_t* extension, int32_t type, TONEWRIGHT_PluginInfo* info) {
    return guard(0, [&] {
        const SMediaEnvironment environment = getMediaEnvironment();
        const bool isWriting = type & (kAudioFormat | kVideoFormat);
        const P<IPluginHandler> handler =
            requireHandler(isWriting ? environment.writeHandler : environment.readHandler);
        const std::u16string file = std::u16string(u"file:///x.") + (extension ? extension : u"");
        const P<peru::IURI> uri = tonewright::exports::toURI(file.c_str());
        TONEWRIGHT_PluginInfo values = {};
        const bool isFound = askPlugins(uri, handler, type, [&](ISonoraPlugin& plugin) {
            copyText(values.plugin, CString::toStdString(plugin.getPluginName()));
            values.isBoxed = dynamic_cast<CPluginModuleBoxed*>(&plugin) != nullptr;
            return true;
        });
        if (!isFound && isWriting) failWithoutWriter(uri, *handler);
        if (!isFound) failWithoutReader(uri, *handler);
        fillRecord(info, values);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_GetCapabilities(const char16_t* uri, TONEWRIGHT_Capabilities* capabilities) {
    return guard(0, [&] {
        const P<peru::IURI> target = tonewright::exports::toURI(uri);
        const P<IPluginHandler> handler = requireHandler(getMediaEnvironment().writeHandler);
        if (!askPlugins(target, handler, kAudioFormat, [](ISonoraPlugin&) { return true; }))
            failWithoutWriter(target, *handler);

        // A codec's limits of rate, channels and width are taken as independent, so each is tested by varying
        // one format that is accepted.
        static constexpr int kRates[] = {8000,  11025, 12000, 16000, 22050,  24000,  32000,  44100,
                                         48000, 64000, 88200, 96000, 176400, 192000, 352800, 384000};
        CWriterQuestions questions(target, handler);
        const auto canWrite = [&](int ofRate, int ofChannels, int ofBytes) {
            return findFormat(questions, target, handler, ofRate, ofChannels, ofBytes).has_value();
        };
        TONEWRIGHT_Capabilities values = {};
        int rate = 0, channels = 0, bytes = 0;
        for (const int width : {2, 3, 4, 1})
            for (const int count : {2, 1})
                for (const int candidate : {44100, 48000, 16000, 8000})
                    if (rate == 0 && canWrite(candidate, count, width))
                        rate = candidate, channels = count, bytes = width;
        if (rate > 0) {
            values.settings = findFormat(questions, target, handler, rate, channels, bytes)
                                  .value_or(IFormatSettings::kAllSettings);
            for (const int candidate : kRates)
                if (canWrite(candidate, channels, bytes)) values.rates[values.rateCount++] = candidate;
            for (int count = 1; count <= 32; ++count)
                if (canWrite(rate, count, bytes)) values.channelCounts |= 1u << (count - 1);
            for (int width = 1; width <= 4; ++width)
                if (canWrite(rate, channels, width)) values.widths |= 1u << (width - 1);
        }
        fillRecord(capabilities, values);
        return 1;
    });
}

int32_t TONEWRIGHT_Host_CanWrite(const char16_t* uri, int32_t sampleRate, int32_t channelCount,
                                 int32_t bytesPerSample) {
    return guard(0, [&] {
        const P<IPluginHandler> handler = requireHandler(getMediaEnvironment().writeHandler);
        const P<peru::IURI> target = tonewright::exports::toURI(uri);
        CWriterQuestions questions(target, handler);
        return findFormat(questions, target, handler, sampleRate, channelCount, bytesPerSample) ? 1 : 0;
    });
}
