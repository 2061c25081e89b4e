// Damaged files either open or are refused with vexo::Exception: never a crash, a hang or a huge allocation.
// Run under AddressSanitizer, these walks also catch out-of-bounds reads and leaks.
#include <gtest/gtest.h>

#include <random>
#include <string>

#include "Manifest.h"
#include "TestFiles.h"
#include "WalkFile.h"

namespace {

// Lengths to cut a file at: the whole header region densely, then a spread across the rest.
std::vector<size_t> cutPoints(size_t size) {
    std::vector<size_t> cuts;
    for (size_t n = 0; n < size && n < 1200; n += 37)
        cuts.push_back(n);
    for (int i = 1; i < 16; ++i)
        cuts.push_back(size * i / 16);
    return cuts;
}

} // namespace

TEST(Robustness, MalformedCorpusFilesAreReadOrRefused) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    for (const CorpusFile& file : manifest.files()) {
        if (file.entry->value("malformed", false))
            walkFile(file.path);
    }
}

TEST(Robustness, TruncatedFilesAreReadOrRefused) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    TempFile scratch;
    for (const CorpusFile& file : manifest.files()) {
        std::string bytes = readWholeFile(file.path);
        for (size_t cut : cutPoints(bytes.size())) {
            SCOPED_TRACE(file.relative + " cut at " + std::to_string(cut));
            scratch.write(bytes.substr(0, cut));
            walkFile(scratch.path());
        }
    }
}

TEST(Robustness, FilesWithFlippedHeaderBytesAreReadOrRefused) {
    SKIP_WITHOUT_CORPUS();
    const Manifest& manifest = Manifest::get();
    std::mt19937 random(20261121);
    TempFile scratch;
    for (const CorpusFile& file : manifest.files()) {
        std::string original = readWholeFile(file.path);
        if (original.size() < 16)
            continue;
        // Flip bytes in the first few kilobytes, where the headers and sub-headers are.
        size_t span = std::min<size_t>(original.size(), 4096);
        for (int round = 0; round < 12; ++round) {
            std::string bytes = original;
            for (int flips = 0; flips < 1 + round % 4; ++flips)
                bytes[random() % span] = static_cast<char>(random() & 0xFF);
            SCOPED_TRACE(file.relative + " round " + std::to_string(round));
            scratch.write(bytes);
            walkFile(scratch.path());
        }
    }
}
