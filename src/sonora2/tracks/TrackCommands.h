// Commands for tracks and track lists.
#pragma once

#include "peru/Object.h"
#include "sonora2/tracks/ITrack.h"

namespace sonora2::common {

// A command's name and target. Immutable: one object may be sent to any number of tracks.
class SONORA2_API CTrackCommand : public peru::CObject, public ITrackCommand {
public:
    ~CTrackCommand() override;
    P<peru::IString> getCommandName() const override { return m_name; }
    P<peru::IString> getCommandTarget() const override { return m_target; }

protected:
    CTrackCommand(const char* name, const peru::CStringArg& target);

private:
    P<peru::IString> m_name;
    P<peru::IString> m_target;
};

// Whether a command is addressed to the track with that id.
SONORA2_API bool isMeantFor(const ITrackCommand& command, const P<peru::IString>& trackId);

// Continues from another time. A list converts it to its own time before passing it to its tracks.
class SONORA2_API CSkipToTimeCommand : public CTrackCommand {
public:
    static constexpr const char* kName = "CSkipToTimeCommand";
    explicit CSkipToTimeCommand(double time); // seconds
    ~CSkipToTimeCommand() override;
    P<ITrackCommand> cloneCommand() const override;
    double getTime() const { return m_time; }

private:
    double m_time;
};

class SONORA2_API CEnableTrackCommand : public CTrackCommand {
public:
    static constexpr const char* kName = "CEnableTrackCommand";
    CEnableTrackCommand(const peru::CStringArg& target, bool enabled);
    ~CEnableTrackCommand() override;
    P<ITrackCommand> cloneCommand() const override;
    bool isEnabled() const { return m_enabled; }

private:
    bool m_enabled;
};

class SONORA2_API CSetAudioEqualizerCommand : public CTrackCommand {
public:
    static constexpr const char* kName = "CSetAudioEqualizerCommand";
    CSetAudioEqualizerCommand(const peru::CStringArg& target, int preset); // 0 is none
    ~CSetAudioEqualizerCommand() override;
    P<ITrackCommand> cloneCommand() const override;
    int getPreset() const { return m_preset; }

private:
    int m_preset;
};

// Opens or closes a track on a thread other than the one that plays the list.
class SONORA2_API COpenThreadIndependentCommand : public CTrackCommand {
public:
    static constexpr const char* kName = "COpenThreadIndependentCommand";
    explicit COpenThreadIndependentCommand(const peru::CStringArg& target, bool close = false);
    ~COpenThreadIndependentCommand() override;
    P<ITrackCommand> cloneCommand() const override;
    bool isClose() const { return m_close; }

private:
    bool m_close;
};

} // namespace sonora2::common
