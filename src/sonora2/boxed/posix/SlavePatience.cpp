#include "sonora2/boxed/SlavePatience.h"

#include "peru/threads/IThreadManager.h"

#include <filesystem>
#include <fstream>
#include <string>

namespace sonora2::common {

namespace {

constexpr int kLooks = 20;
constexpr uint32_t kPause = 5;           // milliseconds between looks
constexpr char kUninterruptible[] = "D"; // the state of a thread that no signal wakes

bool isBlocked(const std::filesystem::path& task) {
    std::ifstream file(task / "stat");
    std::string text;
    std::getline(file, text);
    const size_t nameEnd = text.rfind(") ");
    return nameEnd != std::string::npos && text.compare(nameEnd + 2, 1, kUninterruptible) == 0;
}

} // namespace

bool isWaitingForDevice(int64_t process) {
    const std::filesystem::path tasks = "/proc/" + std::to_string(process) + "/task";
    for (int i = 0; i < kLooks; ++i) {
        if (i > 0) peru::getThreadManager()->sleep(kPause); // between two writes it does not wait
        std::error_code error;
        for (std::filesystem::directory_iterator task(tasks, error), end; !error && task != end;
             task.increment(error))
            if (isBlocked(task->path())) return true;
    }
    return false;
}

} // namespace sonora2::common
