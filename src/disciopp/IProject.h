// Write projects: discs in memory that a host fills and the disc access library writes.
#pragma once

#include "disciopp/IDisc.h"

namespace disciopp {

// One thread at a time for a project and its disc. Functions that fail throw CDISCIOPPException.
class DISCIOPP_API IProject : public virtual peru::IBase {
public:
    virtual DISCIO_Project* getProjectHandle() = 0; // valid as long as the project
    virtual P<IDisc> getVirtualDisc() = 0;          // the same for the life of the project
    // The root of the disc: "discioppvirtualdisc:///1/" or "discioppvirtualdiscaudiocd:///1/", with a number
    // that no other project of this process has.
    virtual P<peru::IURI> getRootURI() = 0;
};

// A project that can be written to a medium or an image.
class DISCIOPP_API IWriteProject : public virtual IProject {};

class DISCIOPP_API IAudioCDProject : public virtual IWriteProject {
public:
    // Inserts a track before the one at `place`; -1 appends. `user` and the record's functions are used on
    // the thread that uses the disc or writes the project. The record's `end` is called once when the stream
    // is no longer needed, also if this function throws.
    virtual void insertTrack(const DISCIO_PCMAudioStreamFuncs& funcs, void* user, int32_t place) = 0;
};

class DISCIOPP_API IDataDiscProject : public virtual IWriteProject {
public:
    // Adds a file whose content is read when the project is written. `target` is relative to the root of the
    // disc, an absolute path on it, or a URI below getRootURI().
    virtual void addFile(const P<peru::IURI>& source, const P<peru::IURI>& target, bool createFolders) = 0;
};

} // namespace disciopp
