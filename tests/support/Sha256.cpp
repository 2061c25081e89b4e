#include "Sha256.h"

#include <stdexcept>

#include <openssl/evp.h>

std::string Sha256::of(const std::string& bytes) {
    unsigned char digest[EVP_MAX_MD_SIZE];
    unsigned int length = 0;
    if (!EVP_Digest(bytes.data(), bytes.size(), digest, &length, EVP_sha256(), nullptr))
        throw std::runtime_error("SHA-256 failed");
    static const char hex[] = "0123456789abcdef";
    std::string text;
    for (unsigned int i = 0; i < length; ++i)
        text += {hex[digest[i] >> 4], hex[digest[i] & 15]};
    return text;
}
