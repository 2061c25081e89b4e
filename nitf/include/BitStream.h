// Bit fields inside a byte buffer, most significant bit first.
#pragma once

class CBitStream {
public:
    explicit CBitStream(unsigned char* data) : m_byte(data), m_mask(128) {}

    // The next `bits` bits (at most 16) as an integer, first bit most significant.
    int read16(int bits);
    // Sets or clears the next `bits` bits from `value`, most significant first; other bits are left alone.
    void write16(int value, int bits);

    unsigned char* getPosition() const { return m_byte; }
    int getMask() const { return m_mask; }

private:
    unsigned char* m_byte;
    int m_mask;
};
