// Scratch files and the test corpus, for the tests and benchmarks.
#pragma once

#include <cstdio>
#include <initializer_list>
#include <string>
#include <vector>

#include "HostError.h"

// A file in the temporary directory, removed when the object goes.
class TempFile {
public:
    explicit TempFile(const std::string& contents = std::string(), const std::string& suffix = ".ntf");
    ~TempFile();
    TempFile(const TempFile&) = delete;
    TempFile& operator=(const TempFile&) = delete;

    const std::string& path() const { return m_path; }
    void write(const std::string& contents) const;
    std::string read() const;

private:
    std::string m_path;
};

// A private directory in the temporary directory, removed with everything in it when the object goes.
class TempDir {
public:
    TempDir();
    ~TempDir();
    TempDir(const TempDir&) = delete;
    TempDir& operator=(const TempDir&) = delete;

    const std::string& path() const { return m_path; }
    // The path of `name` inside; write() makes the directories on the way.
    std::string file(const std::string& name) const { return m_path + "/" + name; }
    void write(const std::string& name, const std::string& contents) const;

private:
    std::string m_path;
};

// A C stream over `bytes` (a temporary file underneath, so 64-bit positions and DKSize work as for real
// files). Closed and removed by the destructor.
class ByteStream {
public:
    explicit ByteStream(const std::string& bytes);
    ~ByteStream();
    ByteStream(const ByteStream&) = delete;
    ByteStream& operator=(const ByteStream&) = delete;

    FILE* get() const { return m_fp; }
    operator FILE*() const { return m_fp; }
    // Everything in the stream, what was written to it included.
    std::string contents() const;

private:
    TempFile m_file;
    FILE* m_fp;
};

// Root of the conformance corpus: $NITF_TEST_DATA, else ../shared/testdata beside the source tree; empty when
// neither exists (tests then skip).
std::string corpusRoot();

// The whole contents of a file (empty when it cannot be read).
std::string readWholeFile(const std::string& path);

// Runs the nitf tool with `arguments` (the rest of a shell command line, which may redirect or pipe; standard
// error is dropped unless they redirect it) and returns its exit status, -1 when it did not exit; `output`
// receives its standard output.
int runTool(const std::string& arguments, std::string* output = nullptr);

// The message of the vexo::Exception that `call` throws, or "" when it returns.
template <typename Call> std::string refusalOf(Call call) {
    try {
        call();
    } catch (const vexo::Exception& e) {
        return e.what();
    }
    return "";
}

// Whether a command of that name is installed.
bool haveCommand(const std::string& name);

// The library's warnings while it lives, collected instead of printed.
class CapturedWarnings {
public:
    CapturedWarnings();
    ~CapturedWarnings();
    CapturedWarnings(const CapturedWarnings&) = delete;
    CapturedWarnings& operator=(const CapturedWarnings&) = delete;

    const std::vector<std::string>& messages() const { return m_messages; }
    // How many of them contain `part`.
    int count(const std::string& part) const;

private:
    std::vector<std::string> m_messages;
    vexo::nspio::Warning::Handler m_previous;
};

// Fields side by side, written one by one for the reader: joined({"0011", "07"}) is "001107".
std::string joined(std::initializer_list<std::string> fields);
