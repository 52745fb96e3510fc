// The record of a disc.
#pragma once

#include "peru/Object.h"
#include "peru/strings/String.h"

#include <vector>

namespace freedb {

using peru::P;

// Text that the record does not have is empty, never an empty handle.
class CAudioTrackInfo : public peru::CObject {
public:
    CAudioTrackInfo() = default;
    ~CAudioTrackInfo() override = default;

    P<peru::IString> title = peru::CString::empty();
    P<peru::IString> artist = peru::CString::empty();   // only on compilations
    P<peru::IString> extended = peru::CString::empty(); // notes, which may have several lines
};

class CAudioCDInfo : public peru::CObject {
public:
    CAudioCDInfo() = default;
    ~CAudioCDInfo() override = default;

    P<peru::IString> artist = peru::CString::empty();
    P<peru::IString> title = peru::CString::empty(); // of the album
    P<peru::IString> year = peru::CString::empty();
    P<peru::IString> genre = peru::CString::empty();
    P<peru::IString> extended = peru::CString::empty(); // notes, which may have several lines
    std::vector<P<CAudioTrackInfo>> tracks;             // up to the last one that has an entry
};

} // namespace freedb
