// Paths on this platform: bytes, with "/" between the segments.
#pragma once

#include "peru/Object.h"
#include "peru/system/IPathes.h"

namespace peru::posix {

// Stateless; thread-safe as long as nobody changes the environment.
class CPathes : public CObject, public IPathes {
public:
    // With forDisplay the text is valid UTF-8: invalid bytes become U+FFFD.
    P<IString> toPlatformPath(const P<IURI>& uri, bool forDisplay = false) override;
    P<IURI> fromPlatformPath(const CStringArg& path) override;
    // The result is below the folder even if the name starts with a separator.
    P<IString> join(const CStringArg& folder, const CStringArg& fileName) override;
    void split(const CStringArg& path, P<IString>& folder, P<IString>& fileName) override;
    // Undefined variables and a "$" without a name are left unchanged.
    P<IString> expandEnvironment(const CStringArg& text) override;
    // Replaces the longest matching folder with $HOME, $XDG_DATA_HOME, $XDG_CONFIG_HOME or $TMPDIR. Throws
    // CError if the result would not expand to the original text.
    P<IString> unexpandEnvironment(const CStringArg& text) override;
};

} // namespace peru::posix
