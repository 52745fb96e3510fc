// Several tags are stored to one file at the same time.
#include "Support.h"
#include "filetag/TagTransfer.h"

#include <thread>

using namespace peru;

namespace {

// Of varying length, so that some stores are made in place and others replace the file
std::string makeText(size_t i) {
    return std::string(i % 3 == 0 ? 3000 : 10, static_cast<char>('a' + i % 26));
}

class SharedFile : public testing::TestWithParam<const char*> {};

} // namespace

// Every store adds another field, so that one that is undone is missing in the end.
TEST_P(SharedFile, NoStoreIsLost) {
    const tests::CTempFolder folder;
    const auto file = tests::makeSound(folder, GetParam());
    const std::string sound = tests::hashSound(file);
    constexpr size_t kWriters = 2, kStores = 15;
    std::vector<std::thread> threads;
    for (size_t writer = 0; writer < kWriters; ++writer)
        threads.emplace_back([&, writer] {
            for (size_t i = 0; i < kStores; ++i)
                filetag::setTagField(tests::toURI(file),
                                     CString::fromUTF8("OWN" + std::to_string(writer * kStores + i)),
                                     {tests::fromStandard(makeText(i))});
        });
    // Album and album artist are not fields of WAVE files.
    const std::vector<const char*> names{"title", "artist", "trackNumber", "year", "genre", "comment"};
    threads.emplace_back([&] {
        for (const tests::SField& field : tests::kFields) {
            if (std::count(names.begin(), names.end(), std::string(field.name)) == 0) continue;
            const P<filetag::IFileTag> tag = tests::open(file);
            ((*tag).*field.set)(field.name);
            std::this_thread::sleep_for(std::chrono::milliseconds(10)); // so that others store meanwhile
            tag->store();
        }
    });
    for (std::thread& thread : threads) thread.join();

    const tests::CTexts fields = tests::readFields(*tests::open(file));
    for (const char* name : names) EXPECT_EQ(fields.at(name), name);
    std::map<std::string, std::string> found;
    for (const filetag::STagField& field : filetag::readAllTags(tests::toURI(file)).fields)
        found[tests::text(field.key)] = tests::text(field.values[0]);
    for (size_t i = 0; i < kWriters * kStores; ++i)
        EXPECT_EQ(found["OWN" + std::to_string(i)], makeText(i % kStores)) << i;
    EXPECT_EQ(tests::hashSound(file), sound);
}

INSTANTIATE_TEST_SUITE_P(Formats, SharedFile, testing::Values("wav", "mp3", "flac", "ogg", "wma"),
                         [](const auto& instance) { return std::string(instance.param); });
