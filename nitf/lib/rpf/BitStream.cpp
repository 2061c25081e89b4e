#include "BitStream.h"

int CBitStream::read16(int bits) {
    int value = 0;
    for (int i = 0; i < bits; ++i) {
        value <<= 1;
        if (*m_byte & m_mask)
            value |= 1;
        m_mask >>= 1;
        if (m_mask == 0) {
            ++m_byte;
            m_mask = 128;
        }
    }
    return value;
}

void CBitStream::write16(int value, int bits) {
    for (int i = bits - 1; i >= 0; --i) {
        if ((value >> i) & 1)
            *m_byte |= m_mask;
        else
            *m_byte &= ~m_mask;
        m_mask >>= 1;
        if (m_mask == 0) {
            ++m_byte;
            m_mask = 128;
        }
    }
}
