#include "KeyStore.h"

#include <algorithm>
#include <cstring>

char* CKeyStore::add(const char* key, size_t length) {
    // Most owners keep a handful of keys: blocks start small and grow.
    static const size_t kFirstBlock = 256;
    static const size_t kLargestBlock = 16384;
    if (m_blocks.empty() || m_used + length + 1 > m_capacity) {
        m_capacity =
            std::max(m_blocks.empty() ? kFirstBlock : std::min(2 * m_capacity, kLargestBlock), length + 1);
        m_blocks.emplace_back(new char[m_capacity]);
        m_used = 0;
    }
    char* copy = m_blocks.back().get() + m_used;
    std::memcpy(copy, key, length);
    copy[length] = '\0';
    m_used += length + 1;
    return copy;
}

void CKeyStore::clear() {
    m_blocks.clear();
    m_used = 0;
    m_capacity = 0;
}
