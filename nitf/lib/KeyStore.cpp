#include "KeyStore.h"

#include <algorithm>
#include <cstring>

char* CKeyStore::add(const char* key, size_t length) {
    // The first keys fill the store's own room; then blocks that start small and grow.
    static const size_t kFirstBlock = 1024;
    static const size_t kLargestBlock = 16384;
    if (m_capacity == 0)
        m_capacity = sizeof m_first;
    if (m_used + length + 1 > m_capacity) {
        m_capacity =
            std::max(m_blocks.empty() ? kFirstBlock : std::min(2 * m_capacity, kLargestBlock), length + 1);
        m_blocks.emplace_back(new char[m_capacity]);
        m_used = 0;
    }
    char* copy = (m_blocks.empty() ? m_first : m_blocks.back().get()) + m_used;
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
