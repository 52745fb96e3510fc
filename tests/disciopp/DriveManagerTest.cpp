#include "disciopp/DriveManager.h"
#include "discio2/DiscSupport.h"
#include "peru/Errors.h"
#include "peru/GlobalObjFactory.h"
#include "support/Environment.h"
#include "support/Files.h"

#include <condition_variable>
#include <deque>
#include <mutex>

using namespace tests;
using namespace disciopp;

namespace {

// Delivers events that the test has scripted, and a clock that the manager's waiting moves on.
class CScriptedEvents : public IDriveEvents {
public:
    struct SScript {
        std::mutex mutex;
        std::condition_variable changed;
        std::deque<std::vector<SMediumEvent>> steps; // guarded by the mutex, as all below
        int64_t time = 0;
        bool isWoken = false;
        bool isIdle = false; // waits for events alone
        std::vector<std::string> watched;

        void add(const std::vector<SMediumEvent>& events) {
            std::lock_guard lock(mutex);
            steps.push_back(events);
            isIdle = false;
            changed.notify_all();
        }
        void waitUntilIdle() {
            std::unique_lock lock(mutex);
            changed.wait_for(lock, std::chrono::seconds(60), [this] { return isIdle; });
        }
    };

    explicit CScriptedEvents(SScript& script) : m_script(script) {}

    void watch(const std::vector<std::string>& drives) override { m_script.watched = drives; }
    std::vector<SMediumEvent> wait(int milliseconds) override {
        std::unique_lock lock(m_script.mutex);
        const auto hasNews = [&] { return m_script.isWoken || !m_script.steps.empty(); };
        if (milliseconds < 0 && !hasNews()) {
            m_script.isIdle = true;
            m_script.changed.notify_all();
            m_script.changed.wait(lock, hasNews);
        }
        m_script.time += std::max(milliseconds, 0);
        if (m_script.steps.empty()) return {};
        const auto events = m_script.steps.front();
        m_script.steps.pop_front();
        return events;
    }
    void wake() override {
        std::lock_guard lock(m_script.mutex);
        m_script.isWoken = true;
        m_script.changed.notify_all();
    }
    int64_t getTime() override {
        std::lock_guard lock(m_script.mutex);
        return m_script.time;
    }

private:
    SScript& m_script;
};

class CListener : public peru::CObject, public IDriveManagerListener {
public:
    ~CListener() override = default;

    void driveChanged(const P<IDrive>& drive, int event) override {
        std::lock_guard lock(m_mutex);
        m_seen += std::to_string(event) + " ";
        m_paths.insert(text(drive->getPath()->getAsString()));
        m_changed.notify_all();
        throw peru::CError("a listener's failure is logged only");
    }
    // The events so far, once there are that many or after a minute.
    std::string take(size_t count) {
        std::unique_lock lock(m_mutex);
        m_changed.wait_for(lock, std::chrono::seconds(60), [&] { return m_seen.size() >= 2 * count; });
        return std::exchange(m_seen, "");
    }
    std::set<std::string> getPaths() {
        std::lock_guard lock(m_mutex);
        return m_paths;
    }

private:
    std::mutex m_mutex;
    std::condition_variable m_changed;
    std::string m_seen;            // guarded by the mutex
    std::set<std::string> m_paths; // guarded by the mutex
};

struct SManager : testing::Test {
    // The library looks for folders once, so every test gets a new one.
    ~SManager() override { peru::CGlobalObjFactory::shutdown(); }

    void writeImage() {
        folder.write("a.bin", makeSectors(3, 1));
        folder.write("a.cue", "FILE a.bin BINARY\nTRACK 01 AUDIO\nINDEX 01 00:00:00\n");
    }

    CTempFolder folder;
    CEnvironment environment{"TONEWRIGHT_DRIVE_FOLDERS", folder.path().string()};
    std::string path = folder.path().string();
    P<CListener> listener = peru::make<CListener>();
};

} // namespace

TEST_F(SManager, EventsFollowTheMedium) {
    CScriptedEvents::SScript script;
    const P<CDriveManager> manager =
        peru::make<CDriveManager>([&] { return std::make_unique<CScriptedEvents>(script); });
    manager->addListener(listener.get());
    EXPECT_EQ(script.watched.back(), path);
    // A medium that never gets ready.
    script.add({{path, true}});
    EXPECT_EQ(listener->take(2), "1 2 ");
    EXPECT_GE(script.time, 30000);
    EXPECT_LE(script.time, 31000);
    // One that is usable, after an event of something that is no drive.
    writeImage();
    script.add({{"/dev/sdx", true}, {path, true}});
    script.waitUntilIdle();
    EXPECT_EQ(listener->take(2), "1 3 ");
    const P<IDrive> drive = manager->findDrive(toURI(path + "/"));
    ASSERT_TRUE(drive);
    EXPECT_TRUE(drive->testDisc());
    for (const char* other : {"http://", "file://host"})
        EXPECT_FALSE(manager->findDrive(peru::make<peru::CURI>((other + path + "/").c_str())));
    std::filesystem::remove(folder / "a.cue");
    script.add({{path, false}});
    EXPECT_EQ(listener->take(1), "4 ");
    EXPECT_FALSE(drive->getDisc()) << "the disc of before is forgotten";
    EXPECT_EQ(listener->getPaths(), std::set<std::string>{"file://" + path + "/"});
    manager->removeListener(listener.get());
    script.add({{path, true}});
    manager->stop();
    EXPECT_EQ(listener->take(0), "");
    EXPECT_FALSE(manager->findDrive(toURI("/dev/null")));
}

// With the kernel's own events.
TEST_F(SManager, ImagesInAFolderArriveAndLeave) {
    const P<IDriveManager> manager = getDriveManager();
    manager->addListener(listener.get());
    writeImage();
    EXPECT_EQ(listener->take(2), "1 3 ");
    std::filesystem::remove(folder / "a.bin");
    EXPECT_EQ(listener->take(1), "4 ");
    manager->removeListener(listener.get());
    manager->stop();
}
