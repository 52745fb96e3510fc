// Errors of sound devices.
#pragma once

#include "peru/Exception.h"
#include "peru/media/Api.h"
#include "peru/strings/String.h"

namespace peru::media {

class PERU_MEDIA_API CMediaException : public CException {
    PERU_EXCEPTION(CMediaException)
    explicit CMediaException(const CStringArg& description);
};

// The description is the engine's text for the error code.
class PERU_MEDIA_API CPortaudioException : public CMediaException {
    PERU_EXCEPTION(CPortaudioException)
    explicit CPortaudioException(int32_t code);
    int32_t getCode() const { return m_code; }

private:
    int32_t m_code;
};

} // namespace peru::media
