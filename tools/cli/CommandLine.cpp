#include "CommandLine.h"

#include <cstdio>
#include <cstring>

namespace cli {

const Command* findCommand(const std::string& name) {
    for (const Command& command : commands()) {
        if (name == command.name)
            return &command;
    }
    return nullptr;
}

void printOverview(FILE* out) {
    std::fprintf(out, "usage: nitf COMMAND [OPTIONS] ARGUMENTS\n       nitf --version\n\ncommands:\n");
    for (const Command& command : commands())
        std::fprintf(out, "  %-10s %s\n", command.name, command.summary);
    std::fprintf(out, "\n'nitf COMMAND --help' describes a command's options.\n");
}

void printHelp(const Command& command, FILE* out) {
    std::fprintf(out, "usage: nitf %s %s\n\n%s\n", command.name, command.arguments, command.summary);
    if (command.details && *command.details)
        std::fprintf(out, "\n%s", command.details);
    std::fprintf(out, "  -h, --help     this text\n");
}

Options::Options(const Command& command, std::vector<option> longOptions, const char* shortOptions)
    : m_command(command), m_long(std::move(longOptions)), m_short(shortOptions) {
    m_long.push_back({nullptr, 0, nullptr, 0});
}

void Options::start(int argc, char** argv) {
    m_arguments.assign(1, const_cast<char*>(m_command.name));
    m_arguments.insert(m_arguments.end(), argv, argv + argc);
    optind = 0; // a fresh scan
    opterr = 0; // messages are ours
}

int Options::next(int argc, char** argv) {
    int code = getopt_long(argc, argv, m_short.c_str(), m_long.data(), nullptr);
    if (code == '?') {
        const char* given = argv[optind - 1];
        std::fprintf(stderr, "nitf %s: unknown option or missing value: %s\n", m_command.name, given);
    }
    return code;
}

int Options::usageError(const char* message) const {
    if (message)
        std::fprintf(stderr, "nitf %s: %s\n", m_command.name, message);
    std::fprintf(stderr, "usage: nitf %s %s\n('nitf %s --help' for more)\n", m_command.name,
                 m_command.arguments, m_command.name);
    return 2;
}

void reportError(const char* command, const std::string& file, const std::string& message) {
    std::fprintf(stderr, "nitf %s: %s: %s\n", command, file.c_str(), message.c_str());
}

WarningsOnStderr::WarningsOnStderr(const char* command, const std::string& file) {
    m_previous =
        vexo::nspio::Warning::setHandler([this, command, file](const char* message, const char*, int) {
            std::lock_guard<std::mutex> lock(m_mutex);
            if (m_seen.insert(message).second)
                std::fprintf(stderr, "nitf %s: %s: warning: %s\n", command, file.c_str(), message);
        });
}

WarningsOnStderr::~WarningsOnStderr() {
    vexo::nspio::Warning::setHandler(m_previous);
}

} // namespace cli
