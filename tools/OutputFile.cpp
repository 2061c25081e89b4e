#include "OutputFile.h"

#include <stdexcept>

OutputFile::OutputFile(const std::string& path) : m_path(path) {
    m_fp = path == "-" ? stdout : std::fopen(path.c_str(), "wb");
    if (!m_fp)
        throw std::runtime_error("cannot create " + path);
}

OutputFile::~OutputFile() {
    if (m_fp == stdout)
        return;
    std::fclose(m_fp);
    if (!m_committed)
        std::remove(m_path.c_str());
}

void OutputFile::write(const void* data, size_t size) {
    if (size > 0 && std::fwrite(data, 1, size, m_fp) != size)
        throw std::runtime_error("cannot write " + m_path);
}

void OutputFile::commit() {
    if (std::fflush(m_fp) != 0)
        throw std::runtime_error("cannot write " + m_path);
    m_committed = true;
}
