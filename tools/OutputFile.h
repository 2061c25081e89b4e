// An output file of the tool ("-" is standard output), removed again unless the work that writes it
// completes.
#pragma once

#include <cstdio>
#include <string>

class OutputFile {
public:
    explicit OutputFile(const std::string& path);
    ~OutputFile();
    OutputFile(const OutputFile&) = delete;
    OutputFile& operator=(const OutputFile&) = delete;

    FILE* get() const { return m_fp; }
    int descriptor() const { return fileno(m_fp); }
    const std::string& path() const { return m_path; }
    void write(const void* data, size_t size);
    // Flushes and keeps the file.
    void commit();

private:
    std::string m_path;
    FILE* m_fp;
    bool m_committed = false;
};
