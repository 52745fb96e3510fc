// The context of the audio side of the framework.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ISonoraContext.h"

#include <map>
#include <string>
#include <vector>

namespace sonora2::audio {

using peru::P;

class SONORA2_API ISonoraContextAudio : public virtual common::ISonoraContext {};

// Safe from any thread: plug-ins, encoders and the slave's servers read one context at the same time.
class SONORA2_API CSonoraContextAudio : public peru::CObject, public ISonoraContextAudio {
public:
    CSonoraContextAudio();
    ~CSonoraContextAudio() override;

    void setMemoryManager(const P<peru::IMemoryManager>& memoryManager) override;
    P<peru::IMemoryManager> getMemoryManager() override;
    void setSwitchB(bool value) override;
    bool getSwitchB() override;
    void setSwitchA(bool value) override;
    bool getSwitchA() override;
    P<common::IBaseDirectories> getBaseDirectories() override;
    P<common::ILogManager> getLogManager() override;
    void setLogManager(const P<common::ILogManager>& logManager) override;
    // Never returns an empty handle. A lookup does not create a group.
    P<peru::IString> getParameter(uint32_t key, const peru::CStringArg& name) override;
    void setParameter(uint32_t key, const peru::CStringArg& name, const P<peru::IString>& value) override;
    void addPluginName(const peru::CStringArg& name) override;
    int getPluginNameCount() override;
    P<peru::IString> getPluginNameAt(int index) override; // throws CInvalidArgError outside the list
    void clearPluginNames() override;
    bool hasFlags(uint64_t mask) override;
    void setFlags(uint64_t flags) override;
    uint64_t getFlags() override;
    P<peru::IBase> getHostObject() override;
    void setHostObject(const P<peru::IBase>& object) override;

    // Writes switches, flags, plug-in names and parameters, but not managers, directories and host object.
    // Throws CSonoraError for more than 65535 names, groups or entries of a group.
    void writeTo(const P<peru::IDataOutStream>& stream) const override;
    // Adds to the existing content; changes nothing if the stream ends early.
    void readFrom(const P<peru::IDataInStream>& stream) override;

private:
    using ParameterGroup = std::map<std::string, P<peru::IString>>; // UTF-8 name to value
    using ParameterStore = std::map<uint32_t, ParameterGroup>;

    P<peru::IMutex> m_mutex; // guards everything below
    P<peru::IMemoryManager> m_memoryManager;
    P<common::IBaseDirectories> m_baseDirectories; // never changes
    P<common::ILogManager> m_logManager;
    ParameterStore m_parameters;
    std::vector<P<peru::IString>> m_pluginNames;
    P<peru::IBase> m_hostObject;
    bool m_switchA = true;
    bool m_switchB = false;
    uint64_t m_flags = 0;
};

} // namespace sonora2::audio
