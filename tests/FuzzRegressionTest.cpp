// Inputs that once made a fuzz target fail (fuzz/regressions/TARGET/), replayed through the same walks.
#include <gtest/gtest.h>

#include <filesystem>

#include "HostError.h"
#include "NitfFileReader.h"
#include "TestFiles.h"
#include "WalkFile.h"

TEST(FuzzRegressions, EveryKeptInputIsReadOrRefused) {
    const std::filesystem::path root = std::filesystem::path(NITF_SOURCE_DIR) / "fuzz" / "regressions";
    if (!std::filesystem::exists(root))
        GTEST_SKIP() << "no kept inputs";
    int inputs = 0;
    for (const auto& entry : std::filesystem::recursive_directory_iterator(root)) {
        if (!entry.is_regular_file() || entry.path().filename().string()[0] == '.')
            continue;
        SCOPED_TRACE(entry.path().string());
        const std::string bytes = readWholeFile(entry.path().string());
        walkBytes(bytes.data(), bytes.size());
        CNitfFileReader reader;
        try {
            if (reader.openMemory(bytes.data(), bytes.size()))
                readEveryImage(reader);
        } catch (const vexo::Exception&) {
        }
        ++inputs;
    }
    std::cout << inputs << " kept fuzz inputs replayed\n";
}
