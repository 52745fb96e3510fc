// The encodings of replies.
#pragma once

#include "freedb/Api.h"

#include <string>
#include <string_view>

namespace freedb {

// Replies are UTF-8 in protocol 6, but many servers hold old records in the encoding in which they were
// submitted, so each text is judged by itself.
class FREEDB_API CTextDecoder {
public:
    // Names of encodings for iconv, of which unknown and empty ones are skipped: the one that the application
    // has set, and the one that the server states.
    CTextDecoder(std::string set, std::string stated);

    // UTF-8. Text that is not valid UTF-8 is read in the first of the two encodings that allows it, otherwise
    // in Windows-1252. Control characters, NUL included, become blanks.
    std::string decode(std::string_view bytes) const;

private:
    std::string m_set;
    std::string m_stated;
};

} // namespace freedb
