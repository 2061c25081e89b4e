#include "JpegAmplitudeMap.h"

#include <cmath>
#include <cstring>
#include <string>

#include "NitfExtension.h"
#include "Raise.h"

namespace {

const int kSampleValues = 65536;
const int kLargestInput = 4095; // methods 1 and 2 describe 12-bit input

int intField(const PropertyMap& fields, const char* name) {
    CNitfProperty* field = FindProperty(fields, name);
    return field ? nitf_detail::parseInt(field->toText().c_str()) : 0;
}

unsigned short toSample(double value) {
    return nitf_detail::truncateTo<unsigned short>(value, 0, 65535);
}

double powerOfTwo(int exponent) {
    return std::ldexp(1.0, exponent);
}

} // namespace

CJpegAmplitudeMap::CJpegAmplitudeMap(const PropertyMap& fields, unsigned short amplitudeOffset)
    : m_method(intField(fields, "MAP_SELECT")) {
    switch (m_method) {
    case 0:
        buildShift(fields);
        break;
    case 1:
        buildLookUpTable(fields, amplitudeOffset);
        break;
    case 2:
        buildLogarithmic(fields, amplitudeOffset);
        break;
    default:
        break;
    }
}

void CJpegAmplitudeMap::apply(unsigned char* samples, int count) const {
    if (!mapsSamples())
        return;
    for (int i = 0; i < count; ++i) {
        unsigned short sample;
        std::memcpy(&sample, samples + 2 * i, 2);
        sample = m_table[sample];
        std::memcpy(samples + 2 * i, &sample, 2);
    }
}

// Every sample divided by 2^S2, truncated.
void CJpegAmplitudeMap::buildShift(const PropertyMap& fields) {
    const int s2 = intField(fields, "S2");
    if (s2 == 0)
        return;
    const double scale = 1.0 / powerOfTwo(s2);
    m_table.resize(kSampleValues);
    for (int s = 0; s < kSampleValues; ++s)
        m_table[s] = toSample(std::floor(s * scale));
}

// A table of 4096 output values scaled by 1 / (2^S1 2^S2), plus the scaled amplitude offset, limited to the
// largest value of the scaled range.
void CJpegAmplitudeMap::buildLookUpTable(const PropertyMap& fields, unsigned short amplitudeOffset) {
    const double divisor = powerOfTwo(intField(fields, "S1")) * powerOfTwo(intField(fields, "S2"));
    const double scale = 1.0 / divisor;
    const double maximum = std::floor(4096.0 / divisor - 1);
    const double offset = std::floor(amplitudeOffset / powerOfTwo(intField(fields, "S2")) + 0.5);
    std::vector<unsigned short> outputs(kLargestInput + 1);
    for (int i = 0; i <= kLargestInput; ++i) {
        const std::string name = "OUTPUT_MAP_VALUE_" + std::to_string(i);
        outputs[i] = static_cast<unsigned short>(
            CNitfExtension::getBinaryValue(FindProperty(fields, name.c_str()), 2));
    }
    m_table.resize(kSampleValues);
    for (int s = 0; s < kSampleValues; ++s) {
        const int input = s < kLargestInput ? s : kLargestInput;
        const double value = std::floor(outputs[input] * scale + 0.5) + offset;
        m_table[s] = toSample(value < maximum ? value : maximum);
    }
}

// A logarithmic curve of ratio r = R_WHOLE + R_FRACTION / 256 (linear when r is 1), scaled like method 1.
void CJpegAmplitudeMap::buildLogarithmic(const PropertyMap& fields, unsigned short amplitudeOffset) {
    const double r = intField(fields, "R_WHOLE") + intField(fields, "R_FRACTION") / 256.0;
    const double a = powerOfTwo(intField(fields, "S1"));
    const double b = powerOfTwo(intField(fields, "S2"));
    const double maximum = std::floor(4096.0 / (a * b) - 1);
    const double k = (r - 1) / (4096.0 / (2 * a));
    const double c = k != 0 ? 4095.0 / std::log((4096.0 / a - 1) * k + 1) : 0;
    const double offset = std::floor(amplitudeOffset / b + 0.5);
    m_table.resize(kSampleValues);
    for (int s = 0; s < kSampleValues; ++s) {
        const int input = s < kLargestInput ? s : kLargestInput;
        const double v = r == 1 ? input / (a * b) : ((std::exp(input / c) - 1) / k) / b;
        const double value = offset + std::floor(v + 0.5);
        m_table[s] = toSample(value < maximum ? value : maximum);
    }
}
