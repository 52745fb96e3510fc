#include "writing/Burner.h"

#include <algorithm>
#include <chrono>
#include <thread>
#include <vector>

namespace discio {

namespace {

constexpr auto kPollInterval = std::chrono::milliseconds(20);
constexpr auto kReadyLimit = std::chrono::seconds(60);
constexpr double kCdSpeed = 176.4; // kB in a second
constexpr double kDvdSpeed = 1385;
constexpr double kBdSpeed = 4495.625;
constexpr double kMaxSpeed = 1e6;        // of what drives accept, in kB in a second
constexpr int kCdR = 0x09, kCdRw = 0x0A; // profiles
constexpr int kDvdRam = 0x12, kDvdRwOverwritten = 0x13, kDvdPlusRw = 0x1A, kBdRe = 0x43;

// The library takes these media for blank, whatever they contain.
bool isOverwritten(int profile) {
    return profile == kDvdRam || profile == kDvdRwOverwritten || profile == kDvdPlusRw || profile == kBdRe;
}

std::mutex& getMutex() {
    static std::mutex s_mutex; // the library has one list of drives
    return s_mutex;
}

} // namespace

CBurner::CBurner(const std::string& device)
    : m_library(SBurnLibrary::get()), m_lock(getMutex()), m_device(device) {
    grab();
}

CBurner::~CBurner() {
    release();
}

void CBurner::fail(int32_t code, const std::string& reason) const {
    const std::string message = m_library.takeMessage();
    throw CDiscError(code, m_device + ": " + reason + (message.empty() ? "" : " (" + message + ")"));
}

void CBurner::grab() {
    m_library.takeMessage(); // of earlier calls
    std::string address = m_device;
    if (m_library.burn_drive_scan_and_grab(&m_drives, address.data(), 0) != 1 || !m_drives) {
        m_drives = nullptr;
        fail(DISCIO_ERROR_DEVICE, "the drive is not accessible for writing");
    }
    m_drive = m_drives[0].drive;
}

void CBurner::release() noexcept {
    if (m_drive) m_library.burn_drive_release(m_drive, 0);
    if (m_drives) m_library.burn_drive_info_free(m_drives);
    m_drive = nullptr;
    m_drives = nullptr;
}

burn::burn_disc_status CBurner::getMediumStatus() const {
    const auto due = std::chrono::steady_clock::now() + kReadyLimit;
    while (true) {
        const burn::burn_disc_status status = m_library.burn_disc_get_status(m_drive);
        if (status != burn::BURN_DISC_UNREADY) return status;
        if (std::chrono::steady_clock::now() > due)
            fail(DISCIO_ERROR_DEVICE, "the medium does not get ready");
        std::this_thread::sleep_for(kPollInterval);
    }
}

int CBurner::getProfile() const {
    int profile = 0;
    char name[80] = "";
    m_library.burn_disc_get_profile(m_drive, &profile, name);
    return profile;
}

// Every file system has something in the first 64 kB. What cannot be read has not been written yet.
bool CBurner::hasContent() const {
    std::vector<char> bytes(size_t{64} << 10);
    constexpr int kNoMessage = 2, kNoSingleBlocks = 4;
    off_t count = 0;
    m_library.burn_read_data(m_drive, 0, bytes.data(), static_cast<off_t>(bytes.size()), &count,
                             kNoMessage | kNoSingleBlocks);
    return std::any_of(bytes.begin(), bytes.end(), [](char byte) { return byte != 0; });
}

void CBurner::wait(
    const std::function<void(burn::burn_drive_status, const burn::burn_progress&)>& report) const {
    burn::burn_progress progress{};
    while (true) {
        const burn::burn_drive_status status = m_library.burn_drive_get_status(m_drive, &progress);
        if (status == burn::BURN_DRIVE_IDLE) return;
        report(status, progress);
        std::this_thread::sleep_for(kPollInterval);
    }
}

void CBurner::erase(bool whole, const CProgress& progress) {
    progress.announce(DISCIO_PHASE_BLANK, 0.0);
    m_library.burn_disc_erase(m_drive, !whole);
    wait([&](burn::burn_drive_status, const burn::burn_progress& state) {
        const double fraction = state.sectors > 0 ? static_cast<double>(state.sector) / state.sectors : 0.0;
        progress.announce(DISCIO_PHASE_BLANK, fraction);
    });
    if (!m_library.burn_drive_wrote_well(m_drive))
        fail(DISCIO_ERROR_DEVICE, "the medium could not be blanked");
    progress.announce(DISCIO_PHASE_BLANK, 1.0);
    release(); // the library has the old state of the medium
    grab();
}

void CBurner::blank(bool whole, const CProgress& progress) {
    const burn::burn_disc_status status = getMediumStatus();
    if (status == burn::BURN_DISC_EMPTY) fail(DISCIO_ERROR_NO_DISC, "there is no disc in the drive");
    const int profile = getProfile();
    if (isOverwritten(profile) && profile != kDvdRwOverwritten)
        fail(DISCIO_ERROR_NOT_SUPPORTED, "a disc of this type is overwritten without being blanked");
    if (!m_library.burn_disc_erasable(m_drive))
        fail(DISCIO_ERROR_DISC_NOT_ERASABLE, "the disc is not rewritable");
    if (status == burn::BURN_DISC_BLANK && !whole) return;
    erase(whole, progress);
}

void CBurner::prepare(bool isAudio, bool mayBlank, const CProgress& progress) {
    burn::burn_disc_status status = getMediumStatus();
    if (status == burn::BURN_DISC_EMPTY) fail(DISCIO_ERROR_NO_DISC, "there is no disc in the drive");
    const int profile = getProfile();
    if (isAudio && profile != kCdR && profile != kCdRw && status == burn::BURN_DISC_BLANK)
        fail(DISCIO_ERROR_UNSUPPORTED_DISC_TYPE, "an audio CD needs a CD-R or a CD-RW");
    const bool isErasable = m_library.burn_disc_erasable(m_drive);
    if (status != burn::BURN_DISC_BLANK && isErasable && mayBlank) {
        erase(false, progress);
        status = getMediumStatus();
    }
    const bool isUsed = isOverwritten(profile) && !mayBlank && hasContent();
    if (status == burn::BURN_DISC_BLANK && !isUsed) return;
    if (isUsed || isErasable || status == burn::BURN_DISC_APPENDABLE)
        fail(DISCIO_ERROR_DISC_NOT_EMPTY, "the disc is not empty");
    fail(DISCIO_ERROR_DISC_NOT_WRITABLE, "the disc cannot be written to");
}

void CBurner::write(const CBurnSession& session, bool isAudio, const SBurnSettings& settings,
                    const CProgress& progress) {
    const std::unique_ptr<burn::burn_write_opts, void (*)(burn::burn_write_opts*)> options(
        m_library.burn_write_opts_new(m_drive), m_library.burn_write_opts_free);
    if (!options) fail(DISCIO_ERROR_INTERNAL, "no memory");
    m_library.burn_write_opts_set_multi(options.get(), 0);
    m_library.burn_write_opts_set_underrun_proof(options.get(), 1);
    m_library.burn_write_opts_set_perform_opc(options.get(), 0); // the drives do that by themselves
    if (m_library.burn_write_opts_set_simulate(options.get(), settings.isDummy) != 1 && settings.isDummy)
        fail(DISCIO_ERROR_NOT_SUPPORTED, "the drive cannot simulate");
    if (!settings.textPacks.empty()) {
        std::string packs = settings.textPacks;
        if (m_library.burn_write_opts_set_leadin_text(options.get(),
                                                      reinterpret_cast<unsigned char*>(packs.data()),
                                                      static_cast<int>(packs.size() / 18), 0) != 1)
            fail(DISCIO_ERROR_INTERNAL, "the CD-TEXT is refused");
    }
    if (settings.catalogue.size() == 13) {
        unsigned char digits[13];
        for (size_t i = 0; i < sizeof digits; ++i)
            digits[i] = static_cast<unsigned char>(settings.catalogue[i] - '0');
        m_library.burn_write_opts_set_mediacatalog(options.get(), digits);
        m_library.burn_write_opts_set_has_mediacatalog(options.get(), 1);
    }
    if (isAudio) {
        m_library.burn_write_opts_set_write_type(options.get(), burn::BURN_WRITE_SAO, burn::BURN_BLOCK_SAO);
    } else {
        std::vector<char> reasons(BURN_REASONS_LEN);
        if (m_library.burn_write_opts_auto_write_type(options.get(), session.getDisc(), reasons.data(), 0) ==
            burn::BURN_WRITE_NONE)
            fail(DISCIO_ERROR_DISC_NOT_WRITABLE, reasons.data());
    }
    const int64_t available = m_library.burn_disc_available_space(m_drive, options.get());
    if (available > 0 && session.getBlocks() > available / 2048)
        fail(DISCIO_ERROR_NOT_ENOUGH_SPACE, std::to_string(session.getBlocks()) + " blocks are needed, " +
                                                std::to_string(available / 2048) + " are free");
    std::vector<char> reasons(BURN_REASONS_LEN);
    if (m_library.burn_precheck_write(options.get(), session.getDisc(), reasons.data(), 1) != 1)
        fail(DISCIO_ERROR_DISC_NOT_WRITABLE, reasons.data());
    const int profile = getProfile();
    const double unit = profile < 0x10 ? kCdSpeed : profile < 0x40 ? kDvdSpeed : kBdSpeed;
    m_library.burn_drive_set_speed(m_drive, 0, static_cast<int>(std::min(settings.speed * unit, kMaxSpeed)));
    progress.report(DISCIO_PHASE_WRITE, 0.0); // the last chance to spare the medium
    m_library.burn_disc_write(options.get(), session.getDisc());
    bool isCancelled = false, isStopped = false;
    wait([&](burn::burn_drive_status status, const burn::burn_progress&) {
        const bool isFinishing = status == burn::BURN_DRIVE_WRITING_LEADOUT ||
                                 status == burn::BURN_DRIVE_CLOSING_TRACK ||
                                 status == burn::BURN_DRIVE_CLOSING_SESSION;
        const bool goesOn = isFinishing ? progress.announce(DISCIO_PHASE_FINISH, 0.0)
                                        : progress.announce(DISCIO_PHASE_WRITE, session.getFraction());
        if (!goesOn) isCancelled = true;
        if ((isCancelled || session.getFailure().isSet()) && !isStopped) {
            isStopped = true;
            m_library.burn_drive_cancel(m_drive);
        }
    });
    try {
        checkResult(session, isCancelled);
    } catch (const CDiscError& error) {
        if (settings.isDummy) throw;
        throw CDiscError(error.getCode(), error.what() + std::string("; the medium is partly written"));
    }
    progress.announce(DISCIO_PHASE_FINISH, 1.0);
}

void CBurner::checkResult(const CBurnSession& session, bool isCancelled) const {
    session.getFailure().check();
    if (isCancelled) throw CDiscError(DISCIO_ERROR_ABORTED, "cancelled");
    if (!m_library.burn_drive_wrote_well(m_drive)) fail(DISCIO_ERROR_DEVICE, "writing has failed");
}

} // namespace discio
