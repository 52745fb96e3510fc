#include "media/Arrangement.h"

#include "base/Text.h"
#include "base/Translation.h"
#include "library/Failure.h"

#include <algorithm>
#include <stdexcept>

namespace host {

namespace fs = std::filesystem;

bool isArrangement(const fs::path& file) {
    std::string extension = file.extension();
    std::transform(extension.begin(), extension.end(), extension.begin(),
                   [](unsigned char c) { return std::tolower(c); });
    return extension == ".xml";
}

std::u16string readArrangement(const fs::path& file) {
    checkInput(file);
    char16_t* const text = TONEWRIGHT_Host_ReadArrangement(file.c_str());
    if (!text) throw std::runtime_error(takeFailure(tr("host.unreadable", "The file cannot be read"), file));
    const std::u16string result = text;
    TONEWRIGHT_Host_Free(text);
    return result;
}

CHandle openArrangement(CLibrary& library, const fs::path& file, const SSampleFormat& samples) {
    const std::u16string text = readArrangement(file);
    clearFailure();
    CHandle source(library.CreateAudioSourceFromEditorXml(text.c_str(), samples.rate, samples.channels,
                                                          samples.bytesPerSample));
    if (!source)
        throw std::runtime_error(takeFailure(tr("host.Mix.failed", "The arrangement cannot be mixed"), file));
    if (!(library.AudioSource_GetDuration(source.get()) > 0))
        throw std::runtime_error(
            tr("host.Mix.empty", "The arrangement is empty: no track ends after its start"));
    return source;
}

} // namespace host
