// Files over 4 GB: blocks beyond the 4 GB mark are found and read. The file is sparse (only its header and
// two blocks are written); the test skips where the disk cannot hold it.
#include <gtest/gtest.h>

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <fcntl.h>
#include <sys/statvfs.h>
#include <unistd.h>

#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfRegionReader.h"
#include "NitfSampleWriter.h"
#include "TestFiles.h"

TEST(LargeFile, BlocksBeyondFourGigabytesAreRead) {
    const long long blockBytes = 1 << 20, blocks = 64 * 65; // 64 x 65 blocks: over 4 GiB
    // The header of a 65536 x 66560 image of 1024 x 1024 blocks, written by the sample writer for one
    // block and patched to the whole size.
    nitfsample::Image image;
    image.cols = image.rows = image.nppbh = image.nppbv = 1024;
    image.fields = {{"NCOLS", "00065536"}, {"NROWS", "00066560"}, {"NBPR", "0064"}, {"NBPC", "0065"}};
    image.sample = [](int, int, int) { return 0; };
    nitfsample::File file;
    file.images = {image};
    const std::string small = nitfsample::build(file);
    const long long headers = static_cast<long long>(small.size()) - blockBytes;
    file.fields = {{"FL", std::to_string(headers + blocks * blockBytes)},
                   {"LI1", std::to_string(blocks * blockBytes)}};
    const std::string header = nitfsample::build(file).substr(0, static_cast<size_t>(headers));

    TempFile big("", ".ntf");
    struct statvfs disk;
    if (statvfs(big.path().c_str(), &disk) != 0 ||
        static_cast<long long>(disk.f_bavail) * static_cast<long long>(disk.f_frsize) < (64LL << 20))
        GTEST_SKIP() << "not enough disk for a sparse 4 GB file";
    const int fd = ::open(big.path().c_str(), O_WRONLY | O_TRUNC);
    ASSERT_GE(fd, 0);
    bool written = ::pwrite(fd, header.data(), header.size(), 0) == static_cast<ssize_t>(header.size()) &&
                   ::ftruncate(fd, headers + blocks * blockBytes) == 0;
    // The last two blocks, columns 62 and 63 of block row 64, wholly beyond 4 GiB, each filled with its own
    // byte: the read below crosses their border.
    std::vector<char> fill(static_cast<size_t>(blockBytes));
    for (long long block : {blocks - 1, blocks - 2}) {
        std::fill(fill.begin(), fill.end(), static_cast<char>(block & 0x7F));
        written =
            written && ::pwrite(fd, fill.data(), fill.size(), headers + block * blockBytes) == blockBytes;
    }
    ::close(fd);
    if (!written)
        GTEST_SKIP() << "the file system cannot hold a sparse 4 GB file";

    CNitfFileReader reader;
    ASSERT_TRUE(reader.open(big.path().c_str()));
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(0));
    EXPECT_GT(source->getTileOffset(static_cast<int>(blocks - 1)), 4ULL << 30);
    CNitfRegionReader region(&reader, source.get());
    std::vector<unsigned char> samples(region.getBufferSize(4, 2, 1));
    // Row 65536, the first of the last block row, across the border of the two blocks.
    region.read(64510, 65536, 4, 1, {}, samples.data());
    EXPECT_EQ(samples[0], (blocks - 2) & 0x7F);
    EXPECT_EQ(samples[3], (blocks - 1) & 0x7F);
    region.read(0, 0, 2, 1, {}, samples.data());
    EXPECT_EQ(samples[0], 0);
}
