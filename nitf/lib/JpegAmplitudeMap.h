// The output amplitude mapping of an IOMAPA extension, for 12-bit JPEG samples: shift (method 0), look-up
// table (1) or logarithmic (2), folded into one table over every 16-bit sample value. The piecewise
// polynomial method (3) is recognised and not supported.
#pragma once

#include <vector>

#include "NitfProperty.h"

class CJpegAmplitudeMap {
public:
    // Builds the mapping from the IOMAPA fields (MAP_SELECT, S1, S2, OUTPUT_MAP_VALUE_n, R_WHOLE,
    // R_FRACTION) and the amplitude offset that the stream's "NITF0001.A" marker gave.
    CJpegAmplitudeMap(const PropertyMap& fields, unsigned short amplitudeOffset);

    // MAP_SELECT as read (any value).
    int getMethod() const { return m_method; }
    // False when samples stay as decoded: method 0 with S2 = 0, method 3, other values.
    bool mapsSamples() const { return !m_table.empty(); }
    unsigned short map(unsigned short sample) const { return mapsSamples() ? m_table[sample] : sample; }
    // Maps `count` two-byte samples (native byte order, any alignment) in place.
    void apply(unsigned char* samples, int count) const;

private:
    void buildShift(const PropertyMap& fields);
    void buildLookUpTable(const PropertyMap& fields, unsigned short amplitudeOffset);
    void buildLogarithmic(const PropertyMap& fields, unsigned short amplitudeOffset);

    int m_method;
    std::vector<unsigned short> m_table; // one entry per 16-bit value; empty when nothing is mapped
};
