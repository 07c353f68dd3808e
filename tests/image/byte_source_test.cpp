// Reading files through openSource: sizes and offsets past 2 GiB, which a
// 32-bit host only reaches with 64-bit file offsets.

#include <cstdint>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include "image/byte_source.h"
#include "tests/support/temp_dir.h"

#include <fcntl.h>
#include <unistd.h>

using namespace testing_support;

namespace img {
namespace {

constexpr std::uint64_t kTailOffset = std::uint64_t{3} << 30; // 3 GiB

// A sparse file of 3 GiB + 8 bytes, "tail end" at its end and "head" at its
// start. False where the file system cannot hold it. Written with the 64-bit
// calls whatever off_t is, so that a build without large-file support fails
// the test below instead of skipping it.
bool writeSparseFile(const std::string& path) {
    const int fd = ::open(path.c_str(), O_CREAT | O_WRONLY | O_TRUNC | O_LARGEFILE, 0600);
    if (fd < 0)
        return false;
    const bool written = ::pwrite64(fd, "head", 4, 0) == 4 &&
                         ::pwrite64(fd, "tail end", 8, static_cast<off64_t>(kTailOffset)) == 8;
    return ::close(fd) == 0 && written;
}

TEST(FileSource, ReadsBothEndsOfAFileLargerThanTwoGibibytes) {
    TempDir dir;
    const std::string path = dir.file("large.raw");
    if (!writeSparseFile(path))
        GTEST_SKIP() << "the file system holds no sparse 3 GiB file";

    int result = 1;
    std::unique_ptr<img::ByteSource> source(img::openSource(path.c_str(), &result));
    ASSERT_EQ(result, 0);
    ASSERT_NE(source, nullptr);
    EXPECT_EQ(source->size(), kTailOffset + 8);

    char tail[8] = {};
    ASSERT_TRUE(source->seek(kTailOffset));
    ASSERT_TRUE(source->read(tail, sizeof tail));
    EXPECT_EQ(std::string(tail, sizeof tail), "tail end");
    EXPECT_EQ(source->remaining(), 0u);

    char head[4] = {};
    ASSERT_TRUE(source->seek(0));
    ASSERT_TRUE(source->read(head, sizeof head));
    EXPECT_EQ(std::string(head, sizeof head), "head");
}

} // namespace
} // namespace img
