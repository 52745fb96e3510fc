// One drive.
#pragma once

#include "disciopp/IDrive.h"
#include "peru/threads/IMutex.h"

namespace disciopp {

class CDrive : public CBase, public IDrive {
public:
    // `library` has enumerated its drives. Throws CDISCIOPPException.
    CDrive(DISCIO_Library* library, int32_t index);

    bool testDisc() override;
    void openTray() override;
    void closeTray() override;
    P<peru::CURI> getPath() override { return m_path; }
    P<peru::IString> getName() override { return m_name; }
    P<peru::IString> getRevision() override { return m_revision; }
    P<IDisc> getDisc() override;
    P<IFileSystem> getFileSystem() override { return m_fileSystem; }
    std::vector<double> getReadSpeeds() override;
    DISCIO_Drive* getHandle() override { return m_handle.get(); }

    int32_t getIndex() const { return m_index; }
    // The medium has been taken out or exchanged. Others may still hold the disc, but cannot read it any
    // more.
    void forgetDisc();

private:
    ~CDrive() override;

    const Handle<DISCIO_Drive> m_handle;
    P<peru::IString> m_name;
    const int32_t m_index;
    P<peru::CURI> m_path;
    P<peru::IString> m_revision;
    P<peru::IMutex> m_mutex; // guards the disc, and calls of the library with the handle
    P<IDisc> m_disc;
    P<IFileSystem> m_fileSystem;
};

} // namespace disciopp
