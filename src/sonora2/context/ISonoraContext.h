// Shared settings and services of all framework objects.
#pragma once

#include "peru/MemoryManager.h"
#include "peru/uri/IURI.h"
#include "sonora2/context/ILogManager.h"

namespace sonora2::common {

// Where plug-ins, slave programs and data are looked for. A setter takes a copy.
class SONORA2_API IBaseDirectories : public virtual peru::IBase {
public:
    virtual P<peru::IURI> getPluginDirectory() = 0;
    virtual void setPluginDirectory(const P<peru::IURI>& uri) = 0;
    virtual P<peru::IURI> getSlaveDirectory() = 0;
    virtual void setSlaveDirectory(const P<peru::IURI>& uri) = 0;
    virtual P<peru::IURI> getDataDirectory() = 0;
    virtual void setDataDirectory(const P<peru::IURI>& uri) = 0;
};

// Its serial form is sent to slave processes so that they use the same settings.
class SONORA2_API ISonoraContext : public virtual peru::IBase, public virtual peru::ISerializable {
public:
    virtual void setMemoryManager(const P<peru::IMemoryManager>& memoryManager) = 0;
    virtual P<peru::IMemoryManager> getMemoryManager() = 0;
    virtual void setSwitchB(bool value) = 0;
    virtual bool getSwitchB() = 0;
    virtual void setSwitchA(bool value) = 0;
    virtual bool getSwitchA() = 0;
    virtual P<IBaseDirectories> getBaseDirectories() = 0;
    virtual P<ILogManager> getLogManager() = 0;
    virtual void setLogManager(const P<ILogManager>& logManager) = 0;
    virtual P<peru::IString> getParameter(uint32_t key,
                                          const peru::CStringArg& name) = 0; // empty text when missing
    virtual void setParameter(uint32_t key, const peru::CStringArg& name, const P<peru::IString>& value) = 0;
    virtual void addPluginName(const peru::CStringArg& name) = 0;
    virtual int getPluginNameCount() = 0;
    virtual P<peru::IString> getPluginNameAt(int index) = 0;
    virtual void clearPluginNames() = 0;
    virtual bool hasFlags(uint64_t mask) = 0;  // true if every bit of the mask is set
    virtual void setFlags(uint64_t flags) = 0; // replaces the whole word
    virtual uint64_t getFlags() = 0;
    virtual P<peru::IBase> getHostObject() = 0;
    virtual void setHostObject(const P<peru::IBase>& object) = 0;
};

} // namespace sonora2::common
