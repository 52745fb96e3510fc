#include "disciopp/DriveManager.h"

#include "disciopp/Errors.h"
#include "disciopp/posix/DriveEvents.h"
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "peru/log/ILog.h"
#include "peru/system/IPathes.h"

#include <algorithm>

namespace disciopp {

namespace {

constexpr int64_t kWaitMilliseconds = 30000;
constexpr int kPollMilliseconds = 250; // while a medium gets ready

bool hasPath(const P<CDrive>& drive, const P<peru::IURI>& uri) {
    const P<peru::CURI> path = drive->getPath();
    return path->getScheme()->equals(uri->getScheme()) && path->getHost()->equals(uri->getHost()) &&
           path->getPath()->equals(uri->getPath());
}

} // namespace

P<IDriveManager> getDriveManager() {
    static const peru::CGlobalObjFactory::SKey kKey;
    return peru::CGlobalObjFactory::get<CDriveManager>(
        kKey, [] { return peru::make<CDriveManager>(&posix::createDriveEvents); });
}

CDriveManager::CDriveManager(std::function<std::unique_ptr<IDriveEvents>()> createEvents)
    : m_createEvents(std::move(createEvents)), m_mutex(peru::getMutexFactory()->createMutex()),
      m_listenerMutex(peru::getMutexFactory()->createMutex()) {}

CDriveManager::~CDriveManager() {
    stopThread();
}

void CDriveManager::start() {
    peru::CMutexLock lock(m_mutex);
    if (m_isInitialised) return;
    DISCIO_Library* library = getDiscio();
    if (DISCIO_EnumerateDrives(library) != 1) throw CDISCIOPPException();
    m_isInitialised = true;
    m_drives.clear();
    for (int32_t i = 0; i < DISCIO_GetDriveCount(library); ++i)
        m_drives.push_back(peru::make<CDrive>(library, i));
}

void CDriveManager::stop() {
    stopThread();
    peru::CMutexLock lock(m_mutex);
    m_drives.clear();
    m_isInitialised = false;
}

void CDriveManager::addListener(IDriveManagerListener* listener) {
    {
        peru::CMutexLock lock(m_listenerMutex);
        if (!m_listeners.contains(listener)) m_listeners.add(listener);
    }
    startThread();
}

void CDriveManager::removeListener(IDriveManagerListener* listener) {
    peru::CMutexLock lock(m_listenerMutex);
    m_listeners.remove(listener);
}

std::vector<P<CDrive>> CDriveManager::getDrives() {
    peru::CMutexLock lock(m_mutex);
    if (!m_isInitialised) start();
    return m_drives;
}

int32_t CDriveManager::getDriveCount() {
    return static_cast<int32_t>(getDrives().size());
}

P<IDrive> CDriveManager::getDriveAt(int32_t index) {
    const std::vector<P<CDrive>> drives = getDrives();
    if (index < 0 || index >= static_cast<int32_t>(drives.size()))
        throw peru::CInvalidArgError("index", "CDriveManager::getDriveAt");
    return drives[static_cast<size_t>(index)];
}

P<IDrive> CDriveManager::findDrive(const P<peru::IURI>& path) {
    for (const P<CDrive>& drive : getDrives())
        if (hasPath(drive, path)) return drive;
    return nullptr;
}

P<CDrive> CDriveManager::findByPath(const std::string& path) {
    peru::CMutexLock lock(m_mutex);
    const P<peru::IURI> uri =
        peru::getPathes()->fromPlatformPath(peru::CString::fromUTF8(path))->appendPath("/");
    const auto found = std::find_if(m_drives.begin(), m_drives.end(),
                                    [&](const P<CDrive>& drive) { return hasPath(drive, uri); });
    return found == m_drives.end() ? nullptr : *found;
}

void CDriveManager::startThread() {
    peru::CMutexLock lock(m_mutex);
    if (m_thread) return;
    std::vector<std::string> paths;
    for (const P<CDrive>& drive : getDrives())
        paths.push_back(
            peru::CString::toStdString(peru::newString(DISCIO_DriveGetPathW(drive->getHandle()))));
    std::unique_ptr<IDriveEvents> events = m_createEvents();
    events->watch(paths);
    m_events = std::move(events);
    m_isStopping = false;
    const auto body = [](peru::IBase*, void* self) { static_cast<CDriveManager*>(self)->run(); };
    m_thread = peru::getThreadManager()->createThread({{this, false}, body, this});
}

void CDriveManager::stopThread() {
    P<peru::IThread> thread;
    {
        peru::CMutexLock lock(m_mutex);
        thread = m_thread;
        if (!thread) return;
        m_isStopping = true;
        m_events->wake();
    }
    thread->wait(); // without the mutex, which the thread may need
    peru::CMutexLock lock(m_mutex);
    m_thread.reset();
    m_events.reset();
    m_waiting.clear();
}

void CDriveManager::run() {
    while (!m_isStopping) {
        try {
            for (const SMediumEvent& event : m_events->wait(m_waiting.empty() ? -1 : kPollMilliseconds))
                handle(event);
            pollWaiting();
        } catch (const peru::CException& error) {
            peru::getLogManager()->info(peru::CString::fromUTF8("disciopp"), error.getDescription());
        }
    }
}

void CDriveManager::handle(const SMediumEvent& event) {
    const P<CDrive> drive = findByPath(event.path);
    if (!drive) return;
    drive->forgetDisc();
    if (!event.arrived) {
        notify(drive, kMediumRemoved);
        return;
    }
    notify(drive, kMediumArrived);
    m_waiting.push_back({drive, m_events->getTime()});
}

// The disc test may block for a second, so it runs at most once a second for each drive.
void CDriveManager::pollWaiting() {
    std::vector<SWaiting> waiting;
    waiting.swap(m_waiting);
    for (SWaiting& each : waiting) {
        const int64_t elapsed = m_events->getTime() - each.started;
        if (elapsed / 1000 != each.seenSeconds) {
            each.seenSeconds = elapsed / 1000;
            if (each.drive->testDisc()) {
                notify(each.drive, kMediumUsable);
                continue;
            }
        }
        if (elapsed > kWaitMilliseconds)
            notify(each.drive, kMediumGivenUp);
        else
            m_waiting.push_back(each);
    }
}

void CDriveManager::notify(const P<CDrive>& drive, int event) {
    peru::CMutexLock lock(m_listenerMutex);
    for (size_t i = 0; i < m_listeners.getCount() && !m_isStopping; ++i) {
        // Holds the listener during its call.
        const P<IDriveManagerListener> listener = P<IDriveManagerListener>::share(m_listeners.at(i));
        try {
            listener->driveChanged(drive, event);
        } catch (const peru::CException& error) {
            peru::getLogManager()->info(peru::CString::fromUTF8("disciopp"), error.getDescription());
        }
    }
}

} // namespace disciopp
