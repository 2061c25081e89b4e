#include "ScratchStream.h"

#include <stdexcept>

ScratchStream::ScratchStream(const std::string& bytes) : m_fp(std::tmpfile()) {
    if (!m_fp)
        throw std::runtime_error("no temporary file");
    if (!bytes.empty() && std::fwrite(bytes.data(), 1, bytes.size(), m_fp) != bytes.size()) {
        std::fclose(m_fp);
        throw std::runtime_error("temporary file not written");
    }
    std::fflush(m_fp);
    std::rewind(m_fp);
}

ScratchStream::~ScratchStream() {
    std::fclose(m_fp);
}
