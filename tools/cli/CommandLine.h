// What every nitf command shares: the list of commands, option parsing with getopt_long, the --help text,
// and messages that name the file they are about.
#pragma once

#include <getopt.h>

#include <mutex>
#include <set>
#include <string>
#include <vector>

#include "HostError.h"

namespace cli {

// One command of the tool. Adding a command is its file (which defines run) and one line in Commands.cpp.
struct Command {
    const char* name;
    const char* arguments;             // after the command's name, e.g. "[--json] FILE..."
    const char* summary;               // one line for `nitf --help`
    const char* details;               // the rest of `nitf CMD --help`: options, one per line
    int (*run)(int argc, char** argv); // the arguments after the command's name
};

const std::vector<Command>& commands();
const Command* findCommand(const std::string& name);

// `nitf --help` on `out`.
void printOverview(FILE* out);
// `nitf CMD --help` on `out`.
void printHelp(const Command& command, FILE* out);

// A command's options, parsed with getopt_long. `handle` is called with each option's value (or null) and
// returns false to refuse it; the operands are what is left. Returns -1 to go on, or the exit status when the
// command must stop (2 after a usage error). --help is answered before any command parses (see nitf.cpp).
class Options {
public:
    Options(const Command& command, std::vector<option> longOptions, const char* shortOptions);

    // `argc` and `argv` are the arguments after the command's name.
    template <typename Handle> int parse(int argc, char** argv, Handle handle) {
        start(argc, argv);
        int count = static_cast<int>(m_arguments.size());
        char** args = m_arguments.data();
        for (int code; (code = next(count, args)) != -1;) {
            if (code == '?' || !handle(code, optarg))
                return usageError(nullptr);
        }
        m_operands.assign(args + optind, args + count);
        return -1;
    }

    const std::vector<std::string>& operands() const { return m_operands; }
    // Reports a usage error (with `message` when given) and the usage line; returns 2.
    int usageError(const char* message) const;

private:
    void start(int argc, char** argv);
    int next(int argc, char** argv);

    const Command& m_command;
    std::vector<option> m_long;
    std::string m_short;
    std::vector<std::string> m_operands;
    std::vector<char*> m_arguments; // the command's name, then its arguments
};

// "nitf CMD: FILE: message" on stderr.
void reportError(const char* command, const std::string& file, const std::string& message);

// While it lives, the library's warnings go to stderr as "nitf CMD: FILE: warning: message", each once
// (several decoding threads meet the same causes).
class WarningsOnStderr {
public:
    WarningsOnStderr(const char* command, const std::string& file);
    ~WarningsOnStderr();
    WarningsOnStderr(const WarningsOnStderr&) = delete;
    WarningsOnStderr& operator=(const WarningsOnStderr&) = delete;

private:
    vexo::nspio::Warning::Handler m_previous;
    std::mutex m_mutex;
    std::set<std::string> m_seen;
};

} // namespace cli
