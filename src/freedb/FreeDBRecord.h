// The text form of a record.
#pragma once

#include "freedb/AudioCDInfo.h"
#include "freedb/TextDecoder.h"

#include <map>
#include <string>
#include <string_view>

namespace freedb {

// Collects the lines "key=value" of a record. Comments and lines without a key are ignored.
class CFreeDBRecord {
public:
    void addLine(std::string_view line);
    // Empty if no line has named the album or a track.
    P<CAudioCDInfo> build(const CTextDecoder& decoder) const;

private:
    std::map<std::string, std::string, std::less<>> m_values; // raw bytes
};

} // namespace freedb
