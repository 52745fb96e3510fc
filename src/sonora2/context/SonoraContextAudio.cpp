#include "sonora2/context/SonoraContextAudio.h"

#include "peru/strings/StringFormat.h"
#include "sonora2/context/BaseDirectories.h"
#include "sonora2/context/LogManager.h"
#include "sonora2/context/SonoraError.h"

#include <limits>
#include <utility>

namespace sonora2::audio {

using peru::CMutexLock;
using peru::CString;

namespace {

constexpr int kCachedBlocks = 30;

P<peru::IString> orEmpty(const P<peru::IString>& text) {
    return text ? text : CString::empty();
}

P<peru::IString> keepText(const peru::CStringArg& text) {
    return CString::fromUTF8(CString::toStdString(text));
}

uint16_t countFor(size_t count, const char* what) {
    if (count > std::numeric_limits<uint16_t>::max())
        throw common::CSonoraError(
            peru::format("the context cannot be written: it holds %u %s, at most 65535 are possible",
                         static_cast<uint64_t>(count), what));
    return static_cast<uint16_t>(count);
}

} // namespace

CSonoraContextAudio::CSonoraContextAudio()
    : m_mutex(peru::getMutexFactory()->createMutex()),
      m_memoryManager(peru::make<peru::CMemoryManager>(kCachedBlocks)),
      m_baseDirectories(peru::make<common::CBaseDirectories>()),
      m_logManager(peru::make<common::CLogManager>()) {}

CSonoraContextAudio::~CSonoraContextAudio() = default;

void CSonoraContextAudio::setMemoryManager(const P<peru::IMemoryManager>& memoryManager) {
    P<peru::IMemoryManager> previous = memoryManager; // dies outside the lock
    CMutexLock lock(m_mutex);
    m_memoryManager.swap(previous);
}

P<peru::IMemoryManager> CSonoraContextAudio::getMemoryManager() {
    CMutexLock lock(m_mutex);
    return m_memoryManager;
}

void CSonoraContextAudio::setSwitchB(bool value) {
    CMutexLock lock(m_mutex);
    m_switchB = value;
}

bool CSonoraContextAudio::getSwitchB() {
    CMutexLock lock(m_mutex);
    return m_switchB;
}

void CSonoraContextAudio::setSwitchA(bool value) {
    CMutexLock lock(m_mutex);
    m_switchA = value;
}

bool CSonoraContextAudio::getSwitchA() {
    CMutexLock lock(m_mutex);
    return m_switchA;
}

P<common::IBaseDirectories> CSonoraContextAudio::getBaseDirectories() {
    return m_baseDirectories;
}

P<common::ILogManager> CSonoraContextAudio::getLogManager() {
    CMutexLock lock(m_mutex);
    return m_logManager;
}

void CSonoraContextAudio::setLogManager(const P<common::ILogManager>& logManager) {
    P<common::ILogManager> previous = logManager; // dies outside the lock
    CMutexLock lock(m_mutex);
    m_logManager.swap(previous);
}

P<peru::IString> CSonoraContextAudio::getParameter(uint32_t key, const peru::CStringArg& name) {
    const std::string wanted = CString::toStdString(name);
    CMutexLock lock(m_mutex);
    const auto group = m_parameters.find(key);
    if (group == m_parameters.end()) return CString::empty();
    const auto entry = group->second.find(wanted);
    return entry == group->second.end() ? CString::empty() : entry->second;
}

void CSonoraContextAudio::setParameter(uint32_t key, const peru::CStringArg& name,
                                       const P<peru::IString>& value) {
    std::string text = CString::toStdString(name);
    CMutexLock lock(m_mutex);
    m_parameters[key].insert_or_assign(std::move(text), orEmpty(value));
}

void CSonoraContextAudio::addPluginName(const peru::CStringArg& name) {
    P<peru::IString> text = keepText(name);
    CMutexLock lock(m_mutex);
    m_pluginNames.push_back(std::move(text));
}

int CSonoraContextAudio::getPluginNameCount() {
    CMutexLock lock(m_mutex);
    return static_cast<int>(m_pluginNames.size());
}

P<peru::IString> CSonoraContextAudio::getPluginNameAt(int index) {
    CMutexLock lock(m_mutex);
    if (index < 0 || static_cast<size_t>(index) >= m_pluginNames.size())
        throw peru::CInvalidArgError("index", "CSonoraContextAudio::getPluginNameAt");
    return m_pluginNames[static_cast<size_t>(index)];
}

void CSonoraContextAudio::clearPluginNames() {
    CMutexLock lock(m_mutex);
    m_pluginNames.clear();
}

bool CSonoraContextAudio::hasFlags(uint64_t mask) {
    CMutexLock lock(m_mutex);
    return (m_flags & mask) == mask;
}

void CSonoraContextAudio::setFlags(uint64_t flags) {
    CMutexLock lock(m_mutex);
    m_flags = flags;
}

uint64_t CSonoraContextAudio::getFlags() {
    CMutexLock lock(m_mutex);
    return m_flags;
}

P<peru::IBase> CSonoraContextAudio::getHostObject() {
    CMutexLock lock(m_mutex);
    return m_hostObject;
}

void CSonoraContextAudio::setHostObject(const P<peru::IBase>& object) {
    P<peru::IBase> previous = object; // dies outside the lock
    CMutexLock lock(m_mutex);
    m_hostObject.swap(previous);
}

void CSonoraContextAudio::writeTo(const P<peru::IDataOutStream>& stream) const {
    CMutexLock lock(m_mutex);
    // Checked before the first byte is written, so that nothing is left half written.
    const uint16_t names = countFor(m_pluginNames.size(), "plug-in names");
    const uint16_t groups = countFor(m_parameters.size(), "parameter groups");
    for (const auto& [key, group] : m_parameters) countFor(group.size(), "parameters in a group");

    stream->writeBool(m_switchA);
    stream->writeBool(m_switchB);
    stream->writeInt64(static_cast<int64_t>(m_flags));
    stream->writeUInt16(names);
    for (const P<peru::IString>& name : m_pluginNames) stream->writeString(name);
    stream->writeUInt16(groups);
    for (const auto& [key, group] : m_parameters) {
        stream->writeUInt32(key);
        stream->writeUInt16(static_cast<uint16_t>(group.size()));
        for (const auto& [name, value] : group) {
            stream->writeString(CString::fromUTF8(name));
            stream->writeString(value);
        }
    }
}

void CSonoraContextAudio::readFrom(const P<peru::IDataInStream>& stream) {
    const bool switchA = stream->readBool();
    const bool switchB = stream->readBool();
    const int64_t flags = stream->readInt64();
    std::vector<P<peru::IString>> names;
    for (int left = stream->readUInt16(); left > 0; --left) names.push_back(orEmpty(stream->readString()));
    ParameterStore parameters;
    for (int groups = stream->readUInt16(); groups > 0; --groups) {
        ParameterGroup& group = parameters[stream->readUInt32()];
        for (int left = stream->readUInt16(); left > 0; --left) {
            std::string name = CString::toStdString(stream->readString());
            group.insert_or_assign(std::move(name), orEmpty(stream->readString()));
        }
    }

    CMutexLock lock(m_mutex);
    m_switchA = switchA;
    m_switchB = switchB;
    m_flags = static_cast<uint64_t>(flags);
    m_pluginNames.insert(m_pluginNames.end(), names.begin(), names.end());
    for (auto& [key, group] : parameters) {
        ParameterGroup& own = m_parameters[key];
        for (auto& [name, value] : group) own.insert_or_assign(name, std::move(value));
    }
}

} // namespace sonora2::audio
