// Readers opened on memory and on caller callbacks read exactly what a reader of the file reads; readers of
// one file on several threads do not disturb each other.
#include <gtest/gtest.h>

#include <cstring>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include "Canonical.h"
#include "HostFile.h"
#include "NitfImageSource.h"
#include "NitfTestFile.h"

namespace {

nitfsample::File threeBandFile() {
    nitfsample::Image image;
    image.cols = 70;
    image.rows = 50;
    image.nppbh = image.nppbv = 32;
    image.bands = 3;
    image.imode = 'P';
    image.nbpp = 16;
    nitfsample::File file;
    file.images = {image, image};
    file.images[1].imode = 'S';
    return file;
}

std::vector<std::string> bandsOf(CNitfFileReader& reader, int image) {
    std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(image));
    std::vector<std::string> bands;
    for (int band = 0; band < 3; ++band)
        bands.push_back(canonicalBand(reader, *source, band));
    return bands;
}

// A caller's stream over a string, counting its reads.
struct StringStream {
    std::string bytes;
    size_t position = 0;
    int reads = 0;
    bool closed = false;

    DKStreamCallbacks callbacks() {
        return {
            this,
            [](void* user, void* buffer, size_t size) -> long long {
                StringStream& s = *static_cast<StringStream*>(user);
                ++s.reads;
                const size_t count =
                    std::min(size, s.position < s.bytes.size() ? s.bytes.size() - s.position : 0);
                std::memcpy(buffer, s.bytes.data() + s.position, count);
                s.position += count;
                return static_cast<long long>(count);
            },
            [](void* user, long long offset) {
                static_cast<StringStream*>(user)->position = static_cast<size_t>(offset);
                return 0;
            },
            [](void* user) { return static_cast<long long>(static_cast<StringStream*>(user)->bytes.size()); },
            [](void* user) { static_cast<StringStream*>(user)->closed = true; }};
    }
};

} // namespace

TEST(StreamSeam, MemoryAndCallbackReadersReadWhatTheFileHolds) {
    OpenedSample sample(threeBandFile());
    const std::string bytes = readWholeFile(sample.path());
    const std::vector<std::string> expected0 = bandsOf(sample.reader(), 0),
                                   expected1 = bandsOf(sample.reader(), 1);

    CNitfFileReader memory;
    FILE* fp = memory.openMemory(bytes.data(), bytes.size());
    ASSERT_TRUE(fp);
    EXPECT_EQ(DKSize(fp), static_cast<__int64>(bytes.size()));
    EXPECT_STREQ(fp2filename(fp), "<memory>");
    EXPECT_EQ(memory.getImageCount(), 2);
    EXPECT_EQ(bandsOf(memory, 0), expected0);
    EXPECT_EQ(bandsOf(memory, 1), expected1);

    StringStream stream{bytes};
    {
        CNitfFileReader supplied;
        ASSERT_TRUE(supplied.openStream(stream.callbacks()));
        EXPECT_EQ(DKSize(supplied.getInputStream()), static_cast<__int64>(bytes.size()));
        EXPECT_EQ(bandsOf(supplied, 1), expected1);
        EXPECT_GT(stream.reads, 0);
    }
    EXPECT_TRUE(stream.closed) << "the reader closes the stream it was given";

    CNitfFileReader refused;
    DKStreamCallbacks incomplete = stream.callbacks();
    incomplete.seek = nullptr;
    EXPECT_EQ(refused.openStream(incomplete), nullptr);
    EXPECT_EQ(refused.openMemory(nullptr, 10), nullptr);
}

TEST(StreamSeam, ReadersOfOneFileOnSeveralThreads) {
    OpenedSample sample(threeBandFile());
    const std::vector<std::string> expected = bandsOf(sample.reader(), 0);
    std::vector<std::vector<std::string>> results(4);
    std::vector<std::thread> threads;
    for (size_t t = 0; t < results.size(); ++t)
        threads.emplace_back([&, t] {
            CNitfFileReader reader;
            if (reader.open(sample.path().c_str()))
                for (int i = 0; i < 5; ++i)
                    results[t] = bandsOf(reader, 0);
        });
    for (std::thread& thread : threads)
        thread.join();
    for (const auto& result : results)
        EXPECT_EQ(result, expected);
}
