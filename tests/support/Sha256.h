// SHA-256 (FIPS 180-4), for comparing decoded pixels with the corpus manifest's hashes.
#pragma once

#include <cstddef>
#include <cstdint>
#include <string>

class Sha256 {
public:
    Sha256();
    void update(const void* data, size_t size);
    void update(const std::string& bytes) { update(bytes.data(), bytes.size()); }
    // The digest in lower-case hexadecimal; the object is spent afterwards.
    std::string hex();

    static std::string of(const std::string& bytes);

private:
    void compress(const unsigned char* block);

    uint32_t m_state[8];
    unsigned char m_block[64];
    size_t m_used = 0;
    uint64_t m_length = 0; // bytes hashed so far
};
