#include "freedb/FreeDBQueryCommand.h"
#include "freedb/FreeDBReadCommand.h"
#include "freedb/ILibrary.h"
#include "peru/Errors.h"

#include <mutex>

namespace freedb {

namespace {

class CClient : public peru::CObject, public IFreeDBClient {
public:
    explicit CClient(const SFreeDBSettings& settings) : m_settings(settings) {}
    ~CClient() override = default;

    SFreeDBCandidates query(const std::vector<int32_t>& offsets, int32_t leadOut) override {
        const auto command =
            peru::make<CFreeDBQueryCommand>(m_settings, *CFreeDBDiscInfo::fromOffsets(offsets, leadOut));
        run(command);
        return {command->getResult(), command->getCandidates()};
    }
    P<CAudioCDInfo> read(const P<CFreeDBDiscDesc>& candidate) override {
        const auto command = peru::make<CFreeDBReadCommand>(m_settings, *candidate);
        run(command);
        return command->getInfo();
    }
    void cancel() override {
        std::lock_guard lock(m_mutex);
        m_isCancelled = true;
        if (m_command) m_command->cancel();
    }

private:
    void run(const P<CFreeDBCommand>& command) {
        {
            std::lock_guard lock(m_mutex);
            m_command = command;
            if (m_isCancelled) command->cancel();
        }
        command->advance(true);
        {
            std::lock_guard lock(m_mutex);
            m_command.reset();
        }
        if (command->getResult() != EFreeDBResult::failed) return;
        if (command->isCancelled()) throw peru::CAbortedError();
        throw peru::CError(command->getErrorMessage());
    }

    const SFreeDBSettings m_settings;
    std::mutex m_mutex; // guards the two members below
    P<CFreeDBCommand> m_command;
    bool m_isCancelled = false;
};

class CLibrary : public peru::CObject, public ILibrary {
public:
    CLibrary() = default;
    ~CLibrary() override = default;

    P<IFreeDBClient> createClient(const SFreeDBSettings& settings) override {
        return peru::make<CClient>(settings);
    }
    uint32_t getDiscId(const std::vector<int32_t>& offsets, int32_t leadOut) override {
        return CFreeDBDiscInfo::fromOffsets(offsets, leadOut)->getDiscId();
    }
};

} // namespace

} // namespace freedb

extern "C" FREEDB_API void freedb_getLibrary(freedb::P<freedb::ILibrary>& library) {
    library = peru::make<freedb::CLibrary>();
}
