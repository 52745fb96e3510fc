// What audio and data projects have in common.
#pragma once

#include "disciopp/IProject.h"
#include "peru/uri/URI.h"

namespace disciopp {

class CProjectBase : public CBase, public virtual IProject {
public:
    DISCIO_Project* getProjectHandle() override { return m_project.get(); }
    P<IDisc> getVirtualDisc() override { return m_disc; }
    P<peru::IURI> getRootURI() override { return m_root; }

protected:
    // Throws CDISCIOPPException for a null project.
    CProjectBase(Handle<DISCIO_Project> project, const char* scheme);
    ~CProjectBase() override;

    const Handle<DISCIO_Project> m_project;
    const P<peru::IURI> m_root;
    const P<IDisc> m_disc;
};

// The operations of a disc, for a project that is one: those of its virtual disc.
template <class Interface> class TVirtualDisc : public virtual Interface {
public:
    DISCIO_Disc* getHandle() override { return disc().getHandle(); }
    int32_t getMediumType() override { return disc().getMediumType(); }
    bool isEmpty() override { return disc().isEmpty(); }
    bool isErasable() override { return disc().isErasable(); }
    bool isVirtual() override { return disc().isVirtual(); }
    bool isWritable() override { return disc().isWritable(); }
    int64_t getCapacityBytes() override { return disc().getCapacityBytes(); }
    double getFreeSpaceFraction() override { return disc().getFreeSpaceFraction(); }
    P<peru::IString> getTitle() override { return disc().getTitle(); }
    P<peru::IString> getDisplayName() override { return disc().getDisplayName(); }
    P<IFileSystem> getFileSystem() override { return disc().getFileSystem(); }

protected:
    virtual Interface& disc() = 0;
};

} // namespace disciopp
