#include "disciopp/Drive.h"

#include "disciopp/Discs.h"
#include "disciopp/Errors.h"
#include "disciopp/FileSystems.h"
#include "peru/system/IPathes.h"

namespace disciopp {

namespace {

constexpr int32_t kTestMilliseconds = 1000;

P<peru::IString> requireText(const char16_t* text) {
    if (!text) throw CDISCIOPPException();
    return peru::newString(text);
}

} // namespace

CDrive::CDrive(DISCIO_Library* library, int32_t index)
    : m_handle(DISCIO_OpenDrive(library, index)), m_index(index),
      m_mutex(peru::getMutexFactory()->createMutex()) {
    if (!m_handle) throw CDISCIOPPException();
    m_name = requireText(DISCIO_DriveGetNameW(m_handle.get()));
    const P<peru::IURI> path =
        peru::getPathes()->fromPlatformPath(requireText(DISCIO_DriveGetPathW(m_handle.get())));
    m_path = P<peru::CURI>(path->appendPath("/"));
    m_revision = requireText(DISCIO_DriveGetRevisionW(m_handle.get()));
    m_fileSystem = peru::make<CDriveFileSystem>(m_path, this);
}

CDrive::~CDrive() = default;

bool CDrive::testDisc() {
    peru::CMutexLock lock(m_mutex);
    if (!m_disc && DISCIO_DriveCheckDisc(m_handle.get(), kTestMilliseconds, 0) == 1) {
        Handle<DISCIO_Disc> disc(DISCIO_DriveOpenDisc(m_handle.get()));
        m_disc = CDiscFactory::get()->create(std::move(disc), m_path);
    }
    return static_cast<bool>(m_disc);
}

P<IDisc> CDrive::getDisc() {
    peru::CMutexLock lock(m_mutex);
    testDisc();
    return m_disc;
}

void CDrive::forgetDisc() {
    peru::CMutexLock lock(m_mutex);
    m_disc.reset();
}

void CDrive::openTray() {
    peru::CMutexLock lock(m_mutex);
    if (DISCIO_DriveOpenTray(m_handle.get()) != 1) throw CDISCIOPPException();
}

void CDrive::closeTray() {
    peru::CMutexLock lock(m_mutex);
    if (DISCIO_DriveCloseTray(m_handle.get()) != 1) throw CDISCIOPPException();
}

std::vector<double> CDrive::getReadSpeeds() {
    peru::CMutexLock lock(m_mutex);
    std::vector<double> speeds;
    for (const double* speed = DISCIO_DriveGetReadSpeedList(m_handle.get()); speed && *speed > 0; ++speed)
        speeds.push_back(*speed);
    return speeds;
}

} // namespace disciopp
