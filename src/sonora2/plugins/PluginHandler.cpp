#include "sonora2/plugins/PluginHandler.h"

#include "InstallFolders.h"
#include "peru/IInterfaceQuery.h"
#include "peru/strings/LocalizedFormat.h"
#include "peru/strings/StringFormat.h"
#include "peru/system/IPathes.h"
#include "peru/system/ISystem.h"
#include "peru/uri/URI.h"
#include "sonora2/boxed/BoxedSettings.h"
#include "sonora2/boxed/PluginModuleBoxed.h"
#include "sonora2/context/SonoraError.h"
#include "sonora2/media/CloseGuard.h"
#include "sonora2/plugins/DescribedPlugin.h"
#include "sonora2/plugins/ParameterRecord.h"
#include "sonora2/plugins/PluginExtensions.h"
#include "sonora2/plugins/PluginModule.h"
#include "sonora2/samplerateconverter/SampleRateConverter.h"

#include <algorithm>
#include <filesystem>
#include <string>

namespace sonora2::common {

using peru::CString;
using peru::IString;
using peru::IURI;

struct CPluginHandler::STexts {
    const char* failed; // URI, plug-in, title, description
    const char* failedUnknown;
};

struct CPluginHandler::SAttempts {
    P<IString> key;            // the extension
    SFailure failure;          // of the first candidate that threw
    P<ISonoraPlugin> declined; // the first candidate that did not
};

namespace {

constexpr const char* kLibraryNameFormat = "%s.so";
constexpr const char* kDefaultPlugins[] = {"sonora2_ffmpeg", "sonora2_dsgraph", "sonora2_decmpa"};
constexpr const char* kPreferenceFailed =
    "the remembered plugin for %s cannot be told or kept: unknown exception";
constexpr const char* kImageExtensions[] = {"bmp", "jpg", "png", "tiff"};

bool fileExists(const P<IURI>& file) {
    std::error_code ignored;
    return std::filesystem::is_regular_file(CString::toStdString(peru::getPathes()->toPlatformPath(file)),
                                            ignored);
}

SFailure makeFailure(const P<IString>& message, const P<IURI>& uri) {
    SFailure failure;
    failure.kind = "peru::CFileFormatNotSupportedError";
    failure.message = CString::toStdString(message);
    failure.uri = CString::toStdString(uri->getAsString());
    return failure;
}

// A failure that a plug-in reported: names the file, whatever the plug-in's own text does.
SFailure makeFailure(SFailure failure, const P<IString>& fileName, const P<IURI>& uri) {
    const std::string name = CString::toStdString(fileName);
    if (failure.message.find(name) == std::string::npos) failure.message = name + ": " + failure.message;
    failure.uri = CString::toStdString(uri->getAsString());
    return failure;
}

P<IString> describe(int rate, int channels, int bytesPerSample) {
    return peru::format({"sonora2.CPluginHandler.format", "%d Hz, %d channels, %d bytes per sample"}, rate,
                        channels, bytesPerSample);
}

// Without a candidate there is nothing else to report.
P<IString> explainReading(const P<IString>& extension) {
    if (extension->isEmpty())
        return peru::format(
            {"tonewright.Media.noReaderWithoutExtension", "No plug-in reads files without an extension"});
    return peru::format({"tonewright.Media.noReader", "No plug-in reads .%s files"}, extension);
}

P<IString> explainWriting(const P<IString>& extension) {
    if (extension->isEmpty())
        return peru::format(
            {"tonewright.Media.noWriterWithoutExtension", "No plug-in writes files without an extension"});
    return peru::format({"tonewright.Media.noWriter", "No plug-in writes .%s files"}, extension);
}

bool contains(IPluginExtensions& extensions, const P<IString>& key) {
    for (int i = 0; i < extensions.getCount(); ++i)
        if (extensions.getExtension(i)->equalsIgnoreCase(key)) return true;
    return false;
}

// A described plug-in is loaded when it is needed: the library of its codec may take longer to load than a
// small file takes to convert.
P<ISonoraPlugin> openPlugin(const P<ISonoraContext>& context, const P<IURI>& library) {
    const std::string path = CString::toStdString(peru::getPathes()->toPlatformPath(library));
    if (std::optional<SPluginDescription> description = findDescription(path))
        return peru::make<CDescribedPlugin>(context, library, *std::move(description));
    return peru::make<CPluginModule>(context, library);
}

} // namespace

CPluginHandler::CPluginHandler(const P<ISonoraContext>& context, bool boxed,
                               const peru::CStringArg& uriSuffix, const P<IPluginPreference>& preference)
    : m_context(context), m_boxed(boxed), m_uriSuffix(CString::fromUTF8(CString::toStdString(uriSuffix))),
      m_preference(preference), m_lock(peru::getMutexFactory()->createMutex()) {
    const int count = m_context->getPluginNameCount();
    for (int i = 0; i < count; ++i) loadPlugin(m_context->getPluginNameAt(i));
    if (count > 0) return;
    for (const char* name : kDefaultPlugins) loadPlugin(name);
}

CPluginHandler::~CPluginHandler() = default;

void CPluginHandler::loadPlugin(const peru::CStringArg& name) {
    try {
        const P<IString> fileName = peru::format(kLibraryNameFormat, name);
        const P<IURI> library = findLibrary(fileName);
        if (!library) throw CSonoraError(peru::format("could not load plugin: %s", fileName));
        const P<ISonoraPlugin> module = openPlugin(m_context, library);
        if (m_boxed || isBoxedPlugin(m_context, name))
            addPlugin(makeBoxed(*module, library), module);
        else
            addPlugin(module, module);
    } catch (const peru::CException& e) {
        logLoadFailure(m_context, e);
    }
}

// The slave loads the library that was found here.
P<ISonoraPlugin> CPluginHandler::makeBoxed(ISonoraPlugin& module, const P<IURI>& library) const {
    const P<IString> name = CString::fromUTF8(CString::toStdString(module.getPluginName()));
    m_context->setParameter(kBoxedParameterKey,
                            CString::fromUTF8(kBoxedLibraryParameter + CString::toStdString(name)),
                            library->getAsString());
    return peru::make<CPluginModuleBoxed>(m_context, name);
}

void CPluginHandler::addPlugin(const P<ISonoraPlugin>& plugin, const P<ISonoraPlugin>& plainPlugin) {
    m_plugins.push_back(plugin);
    m_plainPlugins.push_back(plainPlugin);
}

// A directory set for this context takes precedence over the environment and the installed locations; the
// default directory, the program's folder, comes after them.
P<IURI> CPluginHandler::findLibrary(const P<IString>& fileName) const {
    const P<IURI> directory = m_context->getBaseDirectories()->getPluginDirectory();
    const P<IURI> program = peru::getSystem()->getProgramFileFolder();
    const bool isDefault = directory && program && directory->equals(program);
    std::vector<P<IURI>> folders =
        peru::getSystem()->getSearchFolders("TONEWRIGHT_PLUGIN_PATH", TONEWRIGHT_PLUGIN_FOLDER);
    if (directory) folders.insert(isDefault ? folders.end() : folders.begin(), directory);
    for (const P<IURI>& folder : folders) {
        P<IURI> file = folder->appendPath(fileName);
        if (fileExists(file)) return file;
    }
    return nullptr;
}

P<ISonoraPlugin> CPluginHandler::getPlugin(int index) {
    if (index < 0 || index >= getPluginCount())
        throw peru::CInvalidArgError("index", "CPluginHandler::getPlugin");
    return m_plugins[static_cast<size_t>(index)];
}

P<ISonoraPlugin> CPluginHandler::getPlainPlugin(int index) {
    if (index < 0 || index >= getPluginCount())
        throw peru::CInvalidArgError("index", "CPluginHandler::getPlainPlugin");
    return m_plainPlugins[static_cast<size_t>(index)];
}

void CPluginHandler::setVerifyByOpening(bool verify) {
    peru::CMutexLock lock(m_lock);
    m_verifyByOpening = verify;
}

bool CPluginHandler::getVerifyByOpening() {
    peru::CMutexLock lock(m_lock);
    return m_verifyByOpening;
}

void CPluginHandler::setURISuffix(const peru::CStringArg& suffix) {
    peru::CMutexLock lock(m_lock);
    m_uriSuffix = CString::fromUTF8(CString::toStdString(suffix));
}

P<IString> CPluginHandler::getURISuffix() {
    peru::CMutexLock lock(m_lock);
    return m_uriSuffix;
}

P<IPluginExtensions> CPluginHandler::getValidExtensions(int mask) {
    P<CPluginExtensions> all = peru::make<CPluginExtensions>();
    if (mask & kImage) {
        for (const char* extension : kImageExtensions) all->addExtension(CString::fromUTF8(extension));
        return all;
    }
    for (const P<ISonoraPlugin>& plugin : m_plainPlugins) {
        const P<IPluginExtensions> extensions = plugin->getValidExtensions(mask);
        for (int i = 0; extensions && i < extensions->getCount(); ++i)
            all->addExtension(extensions->getExtension(i));
    }
    return all;
}

// The file's name without the suffix of temporary names, for messages.
P<IString> CPluginHandler::getShownName(const P<IURI>& uri) const {
    std::string name = CString::toStdString(peru::CURI::unescape(uri->getFileName()));
    const std::string suffix = CString::toStdString(m_uriSuffix);
    if (!suffix.empty() && name.ends_with(suffix)) name.resize(name.size() - suffix.size());
    return CString::fromUTF8(name);
}

void CPluginHandler::log(int32_t severity, const P<IString>& text) const {
    if (P<ILogManager> manager = m_context->getLogManager()) manager->log(severity, text);
}

// A failing preference must not fail the create call.
template <class Call> void CPluginHandler::askPreference(const P<IURI>& uri, Call call) {
    if (!m_preference) return;
    try {
        call();
    } catch (const peru::CException& e) {
        if (P<ILogManager> manager = m_context->getLogManager()) manager->logException(e);
    } catch (...) {
        log(kSeverityWarning, peru::format(kPreferenceFailed, uri->getAsString()));
    }
}

P<ISonoraPlugin> CPluginHandler::findPreferred(int mask, const P<IURI>& uri) {
    P<ISonoraPlugin> preferred;
    askPreference(uri, [&] {
        const P<IString> name = m_preference->lookUp(mask, uri);
        if (!name || name->isEmpty()) return;
        auto isNamed = [&name](const P<ISonoraPlugin>& plugin) {
            return plugin->getPluginName()->equals(name);
        };
        const auto found = std::find_if(m_plugins.begin(), m_plugins.end(), isNamed);
        if (found != m_plugins.end()) preferred = *found;
    });
    return preferred;
}

void CPluginHandler::storePreferred(int mask, const P<IURI>& uri, ISonoraPlugin& plugin) {
    askPreference(uri, [&] { m_preference->store(mask, uri, plugin.getPluginName()); });
}

// Common to all create calls: tries the remembered plug-in, then each plug-in that lists the extension, in
// order. `tryCreate` returns an object that has passed every test, or an empty handle.
template <class T, class TryCreate> P<T> CPluginHandler::findObject(const P<IURI>& uri, int mask,
                                                                    const STexts& texts, SAttempts& attempts,
                                                                    TryCreate tryCreate) {
    const auto keep = [&](const SFailure& failure) {
        if (attempts.failure.isEmpty()) attempts.failure = failure;
    };
    auto attempt = [&](ISonoraPlugin& plugin, const P<IString>& key, ISonoraPlugin* plain) -> P<T> {
        P<IString> name = CString::empty();
        try {
            name = plugin.getPluginName();
            if (plain) {
                const P<IPluginExtensions> extensions = plain->getValidExtensions(mask);
                if (!extensions || !contains(*extensions, key)) return nullptr;
            }
            P<T> object = tryCreate(plugin);
            if (!object && !attempts.declined) attempts.declined = P<ISonoraPlugin>::share(&plugin);
            return object;
        } catch (const peru::CException& e) {
            keep(describeFailure(e));
            log(kSeverityWarning,
                peru::format(texts.failed, uri->getAsString(), name, e.getTitle(), e.getDescription()));
        } catch (const std::exception& e) {
            keep(describeFailure(e));
            log(kSeverityWarning, peru::format(texts.failedUnknown, uri->getAsString(), name));
        } catch (...) {
            keep({"unknown", "", "unknown exception", ""});
            log(kSeverityWarning, peru::format(texts.failedUnknown, uri->getAsString(), name));
        }
        return nullptr;
    };

    if (P<ISonoraPlugin> preferred = findPreferred(mask, uri))
        if (P<T> object = attempt(*preferred, nullptr, nullptr)) return object;
    const P<IString> key = attempts.key = getLookupKey(uri, m_uriSuffix);
    if (key->isEmpty()) return nullptr;
    for (size_t i = 0; i < m_plugins.size(); ++i) {
        P<T> object = attempt(*m_plugins[i], key, m_plainPlugins[i].get());
        if (!object) continue;
        storePreferred(mask, uri, *m_plugins[i]);
        return object;
    }
    return nullptr;
}

bool CPluginHandler::passesOpening(const P<ISource>& source, bool keepOpened) const {
    if (!m_verifyByOpening) {
        if (source->isOpened()) source->close(); // by the plug-in's own test
        return true;
    }
    source->open();
    const bool opened = source->isOpened();
    if (opened && !keepOpened) source->close();
    return opened;
}

P<ISource> CPluginHandler::findSource(const P<IURI>& uri, int mask, const SSourceParams* params) {
    static constexpr STexts kTexts{"tried to open %s with plugin %s.\nOpening failed: %s - %s",
                                   "tried to open %s with plugin %s.\nOpening failed: unknown exception"};
    peru::CMutexLock lock(m_lock);
    const SSourceParams record = receiveRecord(params);
    if ((mask & kAudioSource) && (!record.nSampleRate || !record.nChannelCount || !record.nBytesPerSample))
        throw CSonoraError("not all sourceparameter fields are valid for creating an audio source");
    SAttempts attempts;
    P<ISource> found =
        findObject<ISource>(uri, mask, kTexts, attempts, [&](ISonoraPlugin& plugin) -> P<ISource> {
            P<ISource> source = plugin.tryCreateSource(uri, mask, true, &record);
            if (source && !passesOpening(source, record.bKeepOpened != 0)) source.reset();
            return source;
        });
    if (!found) setLastFailure(explainSource(uri, mask, attempts, record));
    return found;
}

// A plug-in that declines gives no reason: the file's own format shows why it could not be delivered.
SFailure CPluginHandler::explainSource(const P<IURI>& uri, int mask, const SAttempts& attempts,
                                       const SSourceParams& wanted) const {
    const P<IString> name = getShownName(uri);
    if (!attempts.failure.isEmpty()) return makeFailure(attempts.failure, name, uri);
    if (!attempts.declined) return makeFailure(explainReading(attempts.key), uri);
    try {
        const SSourceParams own{}; // zero: the file's own format
        const P<ISource> opened = attempts.declined->tryCreateSource(uri, mask, true, &own);
        if (const P<IAudioSource> source = peru::interfaceCast<IAudioSource>(opened)) {
            const CCloseGuard guard(*source);
            source->open();
            const int channels = source->getChannelCount();
            if ((mask & kAudioSource) && channels != wanted.nChannelCount &&
                !samplerateconverter::CSampleRateConverter::canConvert(channels, wanted.nChannelCount))
                return makeFailure(peru::format({"sonora2.CPluginHandler.channels",
                                                 "%s has %d channels, which cannot be converted to %d"},
                                                name, channels, wanted.nChannelCount),
                                   uri);
            return makeFailure(
                peru::format({"sonora2.CPluginHandler.inconvertible", "%s (%s) cannot be converted to %s"},
                             name, describe(source->getSampleRate(), channels, source->getBytesPerSample()),
                             describe(wanted.nSampleRate, wanted.nChannelCount, wanted.nBytesPerSample)),
                uri);
        }
    } catch (const std::exception& e) {
        return makeFailure(describeFailure(e), name, uri);
    } catch (...) {
        // The refusal itself is all that is known.
    }
    return makeFailure(
        peru::format({"sonora2.CPluginHandler.unreadable", "%s cannot be read as %s"}, name,
                     describe(wanted.nSampleRate, wanted.nChannelCount, wanted.nBytesPerSample)),
        uri);
}

P<IFormat> CPluginHandler::findFormat(const P<IURI>& uri, int mask, const SFormatParams* params) {
    static constexpr STexts kTexts{"tried to create %s with plugin %s.\nOpening failed: %s - %s",
                                   "tried to create %s with plugin %s.\nOpening failed: unknown exception"};
    peru::CMutexLock lock(m_lock);
    const SFormatParams record = receiveRecord(params);
    SAttempts attempts;
    P<IFormat> found = findObject<IFormat>(uri, mask, kTexts, attempts, [&](ISonoraPlugin& plugin) {
        return plugin.tryCreateFormat(uri, mask, true, &record);
    });
    if (found) return found;
    if (!attempts.failure.isEmpty())
        setLastFailure(makeFailure(attempts.failure, getShownName(uri), uri));
    else if (!attempts.declined)
        setLastFailure(makeFailure(explainWriting(attempts.key), uri));
    else
        setLastFailure(makeFailure(
            peru::format({"sonora2.CPluginHandler.unwritable", "No plug-in writes %s with %s"},
                         getShownName(uri),
                         describe(record.nSampleRate, record.nChannelCount, record.nBytesPerSample)),
            uri));
    return found;
}

P<ISource> CPluginHandler::createSource(const P<IURI>& uri, const SSourceParams* params) {
    return findSource(uri, kVideoSource | kAudioSource, params);
}

P<IVideoSource> CPluginHandler::createVideoSource(const P<IURI>& uri, const SSourceParams* params) {
    return peru::interfaceCast<IVideoSource>(findSource(uri, kVideoSource, params));
}

P<IAudioSource> CPluginHandler::createAudioSource(const P<IURI>& uri, const SSourceParams* params) {
    return peru::interfaceCast<IAudioSource>(findSource(uri, kAudioSource, params));
}

P<IAudioSource> CPluginHandler::createAudioSource(const P<IURI>& uri, int rate, int channels,
                                                  int bytesPerSample, bool keepOpened) {
    SSourceParams params;
    params.bKeepOpened = keepOpened;
    params.nSampleRate = rate;
    params.nChannelCount = channels;
    params.nBytesPerSample = bytesPerSample;
    return createAudioSource(uri, &params);
}

P<IFormat> CPluginHandler::createFormat(const P<IURI>& uri, const SFormatParams* params) {
    return findFormat(uri, kVideoFormat | kAudioFormat, params);
}

P<IVideoFormat> CPluginHandler::createVideoFormat(const P<IURI>& uri, const SFormatParams* params) {
    return peru::interfaceCast<IVideoFormat>(findFormat(uri, kVideoFormat, params));
}

P<IAudioFormat> CPluginHandler::createAudioFormat(const P<IURI>& uri, const SFormatParams* params) {
    return peru::interfaceCast<IAudioFormat>(findFormat(uri, kAudioFormat, params));
}

P<IAudioFormat> CPluginHandler::createAudioFormat(const P<IURI>& uri, int rate, int channels,
                                                  int bytesPerSample) {
    SFormatParams params;
    params.nSampleRate = rate;
    params.nChannelCount = channels;
    params.nBytesPerSample = bytesPerSample;
    return createAudioFormat(uri, &params);
}

P<peru::IBase> CPluginHandler::createObject(const P<IURI>& uri, const SObjectParams* params) {
    static constexpr STexts kTexts{"tried to create %s with plugin %s.\nOpening failed: %s - %s",
                                   "tried to create %s with plugin %s.\nOpening failed: unknown exception"};
    peru::CMutexLock lock(m_lock);
    const SObjectParams record; // it has no field but its size, whatever the caller passed
    SAttempts attempts;
    return findObject<peru::IBase>(uri, kPluginObject, kTexts, attempts, [&](ISonoraPlugin& plugin) {
        return plugin.tryCreateObject(uri, &record);
    });
}

P<ISonoraPicture> CPluginHandler::createPreviewImage(const P<IURI>& uri, double time, int& width,
                                                     int& height) {
    width = height = 0;
    const P<IVideoSource> source = createVideoSource(uri, nullptr);
    if (!source) return nullptr;
    CCloseGuard guard(*source);
    source->open();
    const double duration = source->getDuration();
    if (time > duration) time = duration - 1.0;
    if (time > 0) source->skipToTime(time);
    P<ISonoraPicture> picture = source->getNextPicture();
    if (!picture) return nullptr;
    width = picture->getWidth();
    height = picture->getHeight();
    return picture->getRGBPicture();
}

} // namespace sonora2::common
