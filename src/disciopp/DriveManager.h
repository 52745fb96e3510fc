// Finds the drives and follows their media.
#pragma once

#include "disciopp/Drive.h"
#include "disciopp/IDriveEvents.h"
#include "peru/collections/FrailArray.h"
#include "peru/threads/IThreadManager.h"

#include <functional>

namespace disciopp {

// A singleton of the global object factory. Events are handled on a thread of its own, one after the other.
class DISCIOPP_API CDriveManager : public CBase, public IDriveManager {
public:
    explicit CDriveManager(std::function<std::unique_ptr<IDriveEvents>()> createEvents);

    void addListener(IDriveManagerListener* listener) override;
    void removeListener(IDriveManagerListener* listener) override;
    void start() override;
    void stop() override;
    int32_t getDriveCount() override;
    P<IDrive> getDriveAt(int32_t index) override;
    P<IDrive> findDrive(const P<peru::IURI>& path) override;

protected:
    ~CDriveManager() override;

private:
    // A medium that has arrived and is not usable yet.
    struct SWaiting {
        P<CDrive> drive;
        int64_t started;
        int64_t seenSeconds = -1;
    };

    std::vector<P<CDrive>> getDrives();
    P<CDrive> findByPath(const std::string& path);
    void startThread();
    void stopThread();
    void run();
    void handle(const SMediumEvent& event);
    void pollWaiting();
    void notify(const P<CDrive>& drive, int event);

    const std::function<std::unique_ptr<IDriveEvents>()> m_createEvents;
    P<peru::IMutex> m_mutex; // guards the drives, the flag and the thread
    std::vector<P<CDrive>> m_drives;
    bool m_isInitialised = false;
    P<peru::IThread> m_thread;
    std::unique_ptr<IDriveEvents> m_events; // while the thread runs
    std::atomic<bool> m_isStopping{false};
    std::vector<SWaiting> m_waiting; // the thread's own
    P<peru::IMutex> m_listenerMutex; // guards the listeners; held while they are called
    peru::TFrailArray<IDriveManagerListener> m_listeners;
};

} // namespace disciopp
