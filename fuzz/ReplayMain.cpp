// A fuzz target's entry point without libFuzzer, for CTest: every input file named on the command line, or
// found in a directory named there, is passed to LLVMFuzzerTestOneInput once. A crash, a sanitizer report or
// an exception that escapes the target fails the run; a missing directory replays nothing.
#include <cstdint>
#include <cstdio>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <string>
#include <vector>

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);

namespace {

void replay(const std::filesystem::path& path) {
    std::ifstream in(path, std::ios::binary);
    const std::string bytes((std::istreambuf_iterator<char>(in)), std::istreambuf_iterator<char>());
    std::printf("%s (%zu bytes)\n", path.string().c_str(), bytes.size());
    std::fflush(stdout); // named before a crash cuts the output
    LLVMFuzzerTestOneInput(reinterpret_cast<const uint8_t*>(bytes.data()), bytes.size());
}

} // namespace

int main(int argc, char** argv) {
    int inputs = 0;
    for (int i = 1; i < argc; ++i) {
        const std::filesystem::path argument(argv[i]);
        std::vector<std::filesystem::path> files;
        if (std::filesystem::is_directory(argument)) {
            for (const auto& entry : std::filesystem::directory_iterator(argument))
                if (entry.is_regular_file() && entry.path().filename().string()[0] != '.')
                    files.push_back(entry.path());
        } else if (std::filesystem::exists(argument)) {
            files.push_back(argument);
        }
        for (const auto& file : files) {
            replay(file);
            ++inputs;
        }
    }
    std::printf("%d input(s) replayed\n", inputs);
    return 0;
}
