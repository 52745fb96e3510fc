// What the tests of the library for hosts share.
#pragma once

#include "support/Environment.h"
#include "support/Process.h"
#include "support/TempFolder.h"

#include <gtest/gtest.h>
#include <tonewright/host.h>

#include <memory>

namespace tests {

struct SFree {
    void operator()(void* memory) const { TONEWRIGHT_Host_Free(memory); }
};
template <class Char> using Owned = std::unique_ptr<Char, SFree>;

struct SDestroy {
    void operator()(TONEWRIGHT_HandleData* handle) const { TONEWRIGHT_Host_DestroyHandle(handle); }
};
// Owns a handle.
struct CHandle : std::unique_ptr<TONEWRIGHT_HandleData, SDestroy> {
    using unique_ptr::unique_ptr;
    operator TONEWRIGHT_Handle() const { return get(); }
};

inline std::u16string uriOf(const std::filesystem::path& path) {
    return Owned<char16_t>(TONEWRIGHT_Host_PathToURI(path.c_str())).get();
}

template <class Record> Record makeRecord() {
    Record record = {};
    record.size = sizeof record;
    return record;
}

inline TONEWRIGHT_Failure lastFailure() {
    auto failure = makeRecord<TONEWRIGHT_Failure>();
    TONEWRIGHT_Host_GetLastFailure(&failure);
    return failure;
}

class CHostTest : public testing::Test {
protected:
    void SetUp() override { ASSERT_EQ(TONEWRIGHT_InitStartup(), TONEWRIGHT_OK); }
    void TearDown() override { TONEWRIGHT_DeInitAll(); }

    CEnvironment quiet{"TONEWRIGHT_DEBUG_OUTPUT", "0"};
    CTempFolder folder;
};

} // namespace tests
