// Remembers which plug-in handled a URI.
#pragma once

#include "peru/uri/IURI.h"
#include "sonora2/Api.h"

namespace sonora2::common {

using peru::P;

// Implementations choose the storage. Called with the handler's lock held; exceptions are logged and ignored.
class SONORA2_API IPluginPreference : public virtual peru::IBase {
public:
    // The name of the plug-in for a mask of types and a URI; empty when none is known.
    virtual P<peru::IString> lookUp(int mask, const P<peru::IURI>& uri) = 0;
    virtual void store(int mask, const P<peru::IURI>& uri, const P<peru::IString>& pluginName) = 0;
};

} // namespace sonora2::common
