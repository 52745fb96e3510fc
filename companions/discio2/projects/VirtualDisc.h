// The disc of a project.
#pragma once

#include "Medium.h"

namespace discio {

class CVirtualDisc : public IMedium {
public:
    bool isVirtual() const override { return true; }
    // Throws CDiscError while the disc is being written.
    void requireIdle() const {
        if (m_isBeingWritten)
            throw CDiscError(DISCIO_ERROR_DISC_CONTENTS_IN_USE, "the project is being written");
    }

    // Protects the disc from changes for as long as it exists. Throws CDiscError if the disc is protected.
    class CWriting {
    public:
        explicit CWriting(std::shared_ptr<CVirtualDisc> disc) : m_disc(std::move(disc)) {
            m_disc->requireIdle();
            m_disc->m_isBeingWritten = true;
        }
        ~CWriting() { m_disc->m_isBeingWritten = false; }
        CWriting(const CWriting&) = delete;
        CWriting& operator=(const CWriting&) = delete;

    private:
        std::shared_ptr<CVirtualDisc> m_disc;
    };

private:
    bool m_isBeingWritten = false;
};

} // namespace discio
