#include "disciopp/AudioCDDiscProject.h"

#include "disciopp/Errors.h"
#include "peru/Errors.h"

#include <map>
#include <mutex>

namespace disciopp {

namespace {

// Tracks of living projects can be opened by URI.
struct SProjects {
    std::mutex mutex;
    std::map<std::string, P<IAudioCDDisc>> discs; // by root; guarded by the mutex
};

// Never destroyed: projects may be released at the end of the process.
SProjects& projects() {
    static SProjects& s_projects = *new SProjects;
    return s_projects;
}

std::string toKey(const P<peru::IURI>& root) {
    return peru::CString::toStdString(root->getAsString());
}

} // namespace

CAudioCDDiscProject::CAudioCDDiscProject()
    : CProjectBase(Handle<DISCIO_Project>(DISCIO_CreateAudioCDProject(getDiscio())), kVirtualAudioScheme),
      m_audio(peru::tryCast<IAudioCDDisc>(m_disc)) {
    if (!m_audio) throw peru::CError("The disc of the project is not an audio CD");
    std::scoped_lock lock(projects().mutex);
    projects().discs[toKey(m_root)] = m_audio;
}

CAudioCDDiscProject::~CAudioCDDiscProject() {
    P<IAudioCDDisc> disc; // released outside the lock, since that may release sources
    std::scoped_lock lock(projects().mutex);
    const auto found = projects().discs.find(toKey(m_root));
    if (found == projects().discs.end()) return;
    disc = std::move(found->second);
    projects().discs.erase(found);
}

void CAudioCDDiscProject::insertTrack(const DISCIO_PCMAudioStreamFuncs& funcs, void* user, int32_t place) {
    const Handle<DISCIO_PCMAudioStream> stream(
        DISCIO_CreatePCMAudioStreamFromFuncs(getDiscio(), &funcs, user));
    if (!stream) {
        const CDISCIOPPException failure;
        if (funcs.end) funcs.end(user);
        throw failure;
    }
    if (DISCIO_DiscAudioInsertSegmentPCMAudioStream(getHandle(), stream.get(), place) != 1)
        throw CDISCIOPPException();
}

P<IAudioCDDisc> CAudioCDDiscProject::findDisc(const P<peru::IURI>& root) {
    std::scoped_lock lock(projects().mutex);
    const auto found = projects().discs.find(toKey(root));
    return found == projects().discs.end() ? nullptr : found->second;
}

} // namespace disciopp
