// The replies of servers, parsed.
#pragma once

#include "freedb/Api.h"
#include "freedb/AudioCDInfo.h"
#include "freedb/FreeDBDiscDesc.h"
#include "freedb/TextDecoder.h"

#include <string_view>
#include <vector>

namespace freedb {

enum class EFreeDBResult : int32_t {
    failed = -1,
    pending = 0,
    none = 1,    // no match
    exact = 2,   // one or more matches, or a record
    inexact = 3, // similar discs
};

struct SFreeDBCandidates {
    EFreeDBResult result = EFreeDBResult::none;
    std::vector<P<CFreeDBDiscDesc>> discs;
};

// All of these throw CError with a text for the user.

FREEDB_API SFreeDBCandidates parseQueryReply(std::string_view reply, const CTextDecoder& decoder);
FREEDB_API P<CAudioCDInfo> parseReadReply(std::string_view reply, const CTextDecoder& decoder);

} // namespace freedb
