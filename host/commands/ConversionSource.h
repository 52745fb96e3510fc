// The sound of a conversion's input in the format of its output.
#pragma once

#include "commands/Convert.h"
#include "media/SoundFile.h"

#include <filesystem>
#include <functional>

namespace host {

class CConversionSource {
public:
    // Opens the input and selects the format that comes closest to its own among those that files of the
    // target's kind can hold. Throws std::runtime_error.
    CConversionSource(const std::filesystem::path& input, const std::filesystem::path& target,
                      const SConvertOptions& options);

    const SSampleFormat& getSamples() const { return m_samples; } // of the output
    // Of the input, for its warnings; open once it delivers.
    const CHandle& getSource() const { return m_sound.source; }

    // Has the source deliver the rate and the channels of the output; the width as well unless the output is
    // to have a certain loudness: its samples are rounded after the gain. Throws std::runtime_error.
    void deliver();

    // Measures what the source delivers, and closes it. Empty after Ctrl-C. Throws std::runtime_error.
    CHandle measure(const std::function<void(double)>& progress) const;
    // What the source delivers with a gain in decibels, in the width of the output. Throws
    // std::runtime_error.
    CHandle createGainSource(double decibels) const;

private:
    SSampleFormat chooseSamples(const std::filesystem::path& target) const;
    std::vector<SSampleFormat> listCandidates() const;

    const std::filesystem::path m_input;
    const SConvertOptions& m_options;
    SSoundFile m_sound;
    const SSampleFormat m_samples;
};

} // namespace host
