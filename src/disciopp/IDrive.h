// Drives and notification about them.
#pragma once

#include "disciopp/IDisc.h"
#include "peru/uri/URI.h"

#include <vector>

namespace disciopp {

// Functions that fail throw CDISCIOPPException. Any thread.
class DISCIOPP_API IDrive : public virtual peru::IBase {
public:
    // Whether a disc is held now. Without one, waits up to a second for a medium to get ready.
    virtual bool testDisc() = 0;
    virtual void openTray() = 0;
    virtual void closeTray() = 0;
    virtual P<peru::CURI> getPath() = 0; // of the root folder, with a slash at its end
    virtual P<peru::IString> getName() = 0;
    virtual P<peru::IString> getRevision() = 0;
    virtual P<IDisc> getDisc() = 0; // tests first; empty without a usable medium
    virtual P<IFileSystem> getFileSystem() = 0;
    virtual std::vector<double> getReadSpeeds() = 0;
    virtual DISCIO_Drive* getHandle() = 0; // valid as long as the drive
};

enum EDriveEvent {
    kMediumArrived = 1, // not yet usable
    kMediumGivenUp = 2, // did not become usable in time
    kMediumUsable = 3,
    kMediumRemoved = 4,
};

class DISCIOPP_API IDriveManagerListener : public virtual peru::IBase {
public:
    virtual void driveChanged(const P<IDrive>& drive, int event) = 0;
};

// Any thread.
class DISCIOPP_API IDriveManager : public virtual peru::IBase {
public:
    // Listeners are not owned, and are called one after the other on the manager's thread. removeListener
    // waits for a call in progress; a listener may remove itself during its call. The thread starts with the
    // first listener.
    virtual void addListener(IDriveManagerListener* listener) = 0;
    virtual void removeListener(IDriveManagerListener* listener) = 0;
    // Finds the drives, unless that has been done. Throws CDISCIOPPException.
    virtual void start() = 0;
    // Ends the thread and forgets the drives. Must not be called by a listener.
    virtual void stop() = 0;
    // These start first.
    virtual int32_t getDriveCount() = 0;
    virtual P<IDrive> getDriveAt(int32_t index) = 0;            // throws peru::CInvalidArgError
    virtual P<IDrive> findDrive(const P<peru::IURI>& path) = 0; // empty if there is none
};

DISCIOPP_API P<IDriveManager> getDriveManager();

} // namespace disciopp
