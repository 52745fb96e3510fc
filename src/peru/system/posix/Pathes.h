// Paths of this platform: bytes, with "/" between their segments.
#pragma once

#include "peru/Object.h"
#include "peru/system/IPathes.h"

namespace peru::posix {

// Stateless; safe from any thread as long as nobody changes the environment.
class CPathes : public CObject, public IPathes {
public:
    // With forDisplay the text is valid UTF-8: bytes that are none show as U+FFFD.
    P<IString> toPlatformPath(const P<IURI>& uri, bool forDisplay = false) override;
    P<IURI> fromPlatformPath(const CStringArg& path) override;
    // The result lies below the folder even when the name starts with a separator.
    P<IString> join(const CStringArg& folder, const CStringArg& fileName) override;
    void split(const CStringArg& path, P<IString>& folder, P<IString>& fileName) override;
    // A name that is not defined, and a "$" without a name, stay as they are.
    P<IString> expandEnvironment(const CStringArg& text) override;
    // Puts $HOME, $XDG_DATA_HOME, $XDG_CONFIG_HOME or $TMPDIR in the place of the folder it names, the
    // longest that fits. Throws CError when the result would not expand to the text again.
    P<IString> unexpandEnvironment(const CStringArg& text) override;
};

} // namespace peru::posix
