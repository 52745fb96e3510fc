#include "peru/media/Errors.h"

#include "peru/strings/LocalizedFormat.h"

#include <portaudio.h>

namespace peru::media {

PERU_EXCEPTION_IMPL(CMediaException)
CMediaException::CMediaException(const CStringArg& description)
    : CException(newString("")->concat(description),
                 localize("peru.media.Error.Title", "Sound device error")) {}

PERU_EXCEPTION_IMPL(CPortaudioException)
CPortaudioException::CPortaudioException(int32_t code)
    : CMediaException(Pa_GetErrorText(code)), m_code(code) {}

} // namespace peru::media
