// Scratch files and the test corpus, for the tests and benchmarks.
#pragma once

#include <cstdio>
#include <string>

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

private:
    TempFile m_file;
    FILE* m_fp;
};

// Root of the conformance corpus: $NITF_TEST_DATA, else ../shared/testdata beside the source tree; empty when
// neither exists (tests then skip).
std::string corpusRoot();

// The whole contents of a file (empty when it cannot be read).
std::string readWholeFile(const std::string& path);

// Runs a shell command and returns its standard output; `status` receives its exit status (as from system()).
std::string runCommand(const std::string& command, int& status);
