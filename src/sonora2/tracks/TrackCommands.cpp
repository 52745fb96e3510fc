#include "sonora2/tracks/TrackCommands.h"

#include "peru/strings/String.h"

namespace sonora2::common {

CTrackCommand::CTrackCommand(const char* name, const peru::CStringArg& target)
    : m_name(peru::newString(name)), m_target(peru::CString::fromView(target.getView())) {}

CTrackCommand::~CTrackCommand() = default;

bool isMeantFor(const ITrackCommand& command, const P<peru::IString>& trackId) {
    const P<peru::IString> target = command.getCommandTarget();
    // By bytes: malformed ids are neither empty nor equal to each other.
    return target->getDataSize() == 0 ||
           (trackId && peru::CString::toStdString(target) == peru::CString::toStdString(trackId));
}

CSkipToTimeCommand::CSkipToTimeCommand(double time) : CTrackCommand(kName, ""), m_time(time) {}
CSkipToTimeCommand::~CSkipToTimeCommand() = default;

P<ITrackCommand> CSkipToTimeCommand::cloneCommand() const {
    return peru::make<CSkipToTimeCommand>(m_time);
}

CEnableTrackCommand::CEnableTrackCommand(const peru::CStringArg& target, bool enabled)
    : CTrackCommand(kName, target), m_enabled(enabled) {}
CEnableTrackCommand::~CEnableTrackCommand() = default;

P<ITrackCommand> CEnableTrackCommand::cloneCommand() const {
    return peru::make<CEnableTrackCommand>(getCommandTarget(), m_enabled);
}

CSetAudioEqualizerCommand::CSetAudioEqualizerCommand(const peru::CStringArg& target, int preset)
    : CTrackCommand(kName, target), m_preset(preset) {}
CSetAudioEqualizerCommand::~CSetAudioEqualizerCommand() = default;

P<ITrackCommand> CSetAudioEqualizerCommand::cloneCommand() const {
    return peru::make<CSetAudioEqualizerCommand>(getCommandTarget(), m_preset);
}

COpenThreadIndependentCommand::COpenThreadIndependentCommand(const peru::CStringArg& target, bool close)
    : CTrackCommand(kName, target), m_close(close) {}
COpenThreadIndependentCommand::~COpenThreadIndependentCommand() = default;

P<ITrackCommand> COpenThreadIndependentCommand::cloneCommand() const {
    return peru::make<COpenThreadIndependentCommand>(getCommandTarget(), m_close);
}

} // namespace sonora2::common
