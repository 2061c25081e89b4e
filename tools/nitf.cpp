// The nitf command-line tool: looks into NITF/NSIF files with the library.
#include <cstdio>
#include <cstring>
#include <string>

#include "CommandLine.h"
#include "HostError.h"
#include "NitfVersion.h"

int main(int argc, char** argv) {
    if (argc < 2) {
        cli::printOverview(stderr);
        return 2;
    }
    std::string name = argv[1];
    if (name == "--version" || name == "version") {
        std::printf("nitf %s\n", nitfVersion());
        return 0;
    }
    if (name == "--help" || name == "-h" || name == "help") {
        cli::printOverview(stdout);
        return 0;
    }
    const cli::Command* command = cli::findCommand(name);
    if (!command) {
        std::fprintf(stderr, "nitf: unknown command '%s'\n\n", name.c_str());
        cli::printOverview(stderr);
        return 2;
    }
    // Every command answers --help the same way, whatever its own parsing.
    for (int i = 2; i < argc; ++i) {
        if (std::strcmp(argv[i], "--help") == 0 || std::strcmp(argv[i], "-h") == 0) {
            cli::printHelp(*command, stdout);
            return 0;
        }
    }
    try {
        return command->run(argc - 2, argv + 2);
    } catch (const vexo::Exception& e) {
        std::fprintf(stderr, "nitf %s: %s\n", command->name, e.what());
        return 1;
    }
}
