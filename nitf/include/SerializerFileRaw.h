// Binary values written and read as they are in memory, byte-reversed when the swapping flag is set (the
// file's byte order differs from the host's: RPF files are big-endian).
#pragma once

#include "SerializerFile.h"

namespace nitf {

class CSerializerFileRaw : public CSerializerFile {
public:
    CSerializerFileRaw(FILE* fp, bool swapping) : CSerializerFile(fp), m_swapping(swapping) {}

    bool getSwapping() const { return m_swapping; }
    void setSwapping(bool swapping) { m_swapping = swapping; }

    CSerializer& operator<<(__int64 value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(int value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(short value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(char value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(double value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(unsigned int value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(unsigned short value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(unsigned char value) override { return put(&value, sizeof value); }
    CSerializer& operator<<(const CSerializableArray& array) override;
    CSerializer& operator<<(CSerializable& object) override;

    CSerializer& operator>>(double& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(int& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(short& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(char& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(__int64& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(unsigned int& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(unsigned short& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(unsigned char& value) override { return get(&value, sizeof value); }
    CSerializer& operator>>(CSerializableArray& array) override;
    CSerializer& operator>>(CSerializable& object) override;

    CSerializer& seek(__int64 position) override;
    __int64 tell() override;

protected:
    // Reverses `size` bytes (a power of two) by exchanging halves, recursively.
    static void swap(void* data, int size);

private:
    CSerializer& put(const void* value, int size);
    CSerializer& get(void* value, int size);

    bool m_swapping;
};

} // namespace nitf
