// Sources for the player.
#pragma once

#include "library/Library.h"
#include "media/Playlist.h"
#include "media/SoundFile.h"
#include "media/WebStream.h"

#include <atomic>
#include <memory>
#include <string>

namespace host {

// What became of a source. It is read on the player's thread.
class CPlayResult {
public:
    // Once nothing more can be read: the seconds that were, otherwise a negative number.
    double getLength() const { return m_length; }
    // Valid once getLength() is not negative; empty unless reading failed.
    const std::string& getFailure() const { return m_failure; }

private:
    friend class CItemReader;

    std::string m_failure;
    std::atomic<double> m_length{-1}; // publishes the failure
};

struct SPlaySource {
    CHandle source;
    double duration = 0;
    std::shared_ptr<CPlayResult> result;
    std::shared_ptr<CWebStream> stream; // of an item that is one; reading may wait for it until it is stopped
};

// A source of the item's sound in that format. A failure while it is read ends it early instead of ending the
// player, which has sound of other items queued. Throws std::runtime_error.
SPlaySource openPlaySource(CLibrary& library, const SPlayItem& item, const SSampleFormat& samples);

} // namespace host
