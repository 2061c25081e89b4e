// A C stream over given bytes, on an anonymous temporary file (so that positions and the host's file size
// work as for real files). Closed, and so removed, by the destructor.
#pragma once

#include <cstdio>
#include <string>

class ScratchStream {
public:
    explicit ScratchStream(const std::string& bytes);
    ~ScratchStream();
    ScratchStream(const ScratchStream&) = delete;
    ScratchStream& operator=(const ScratchStream&) = delete;

    FILE* get() const { return m_fp; }

private:
    FILE* m_fp;
};
