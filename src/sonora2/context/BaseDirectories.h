// Where the framework looks for plug-ins, slaves and data.
#pragma once

#include "peru/Object.h"
#include "peru/threads/IMutex.h"
#include "sonora2/context/ISonoraContext.h"

namespace sonora2::common {

// All three default to the folder of the main executable. Safe from any thread.
class SONORA2_API CBaseDirectories : public peru::CObject, public IBaseDirectories {
public:
    CBaseDirectories();
    ~CBaseDirectories() override;

    P<peru::IURI> getPluginDirectory() override;
    void setPluginDirectory(const P<peru::IURI>& uri) override;
    P<peru::IURI> getSlaveDirectory() override;
    void setSlaveDirectory(const P<peru::IURI>& uri) override;
    P<peru::IURI> getDataDirectory() override;
    void setDataDirectory(const P<peru::IURI>& uri) override;

private:
    P<peru::IURI> get(const P<peru::IURI>& member) const;
    void set(P<peru::IURI>& member, const P<peru::IURI>& uri);

    P<peru::IMutex> m_mutex; // guards the three below
    P<peru::IURI> m_pluginDirectory;
    P<peru::IURI> m_slaveDirectory;
    P<peru::IURI> m_dataDirectory;
};

} // namespace sonora2::common
