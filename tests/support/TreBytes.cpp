#include "TreBytes.h"

#include <cstdio>
#include <stdexcept>

#include "NitfTag.h"
#include "TestFiles.h"

std::string padText(const std::string& text, size_t width) {
    std::string out = text.substr(0, width);
    out.resize(width, ' ');
    return out;
}

std::string padNumber(long long value, size_t width) {
    std::string digits = std::to_string(value);
    return digits.size() >= width ? digits : std::string(width - digits.size(), '0') + digits;
}

std::string bigEndian(unsigned long long value, size_t width) {
    std::string out(width, '\0');
    for (size_t i = 0; i < width; ++i)
        out[width - 1 - i] = static_cast<char>((value >> (8 * i)) & 0xFF);
    return out;
}

std::unique_ptr<CNitfExtension> parseTre(const char* name, const std::string& file, long long length,
                                         long long offset) {
    ByteStream stream(file);
    CNitfTag tag;
    tag.setIdentifier(name);
    tag.setDataOffset(offset);
    tag.setDataLength(length < 0 ? static_cast<long long>(file.size()) - offset : length);
    std::unique_ptr<CNitfExtension> extension(CNitfExtension::Build(&tag));
    if (!extension)
        throw std::runtime_error(std::string("no parser for ") + name);
    extension->readNewInfo(stream.get(), false);
    return extension;
}

std::string field(CNitfExtension& extension, const char* key, size_t width) {
    CNitfProperty* property = FindProperty(extension.getProperties(), key);
    if (!property)
        return "<absent>";
    const char* text = property->getAsString();
    return width ? std::string(text, width) : std::string(text);
}

bool hasField(CNitfExtension& extension, const char* key) {
    return FindProperty(extension.getProperties(), key) != nullptr;
}

std::string sampleRpc00b() {
    std::string data = "1"
                       "0001.00"
                       "0000.50"
                       "000500"
                       "00500"
                       "+45.0000"
                       "+010.0000"
                       "+0000"
                       "000500"
                       "00500"
                       "+00.1000"
                       "+000.1000"
                       "+0500";
    auto polynomial = [](int term, const char* value) {
        std::string out;
        for (int i = 1; i <= 20; ++i)
            out += i == term ? value : "+0.000000E+0";
        return out;
    };
    return data + polynomial(3, "-1.000000E+0") + polynomial(1, "+1.000000E+0") +
           polynomial(2, "+1.000000E+0") + polynomial(1, "+1.000000E+0");
}

std::string sampleIchipb() {
    auto number = [](double value) {
        char text[16];
        std::snprintf(text, sizeof text, "%012.3f", value);
        return std::string(text);
    };
    std::string data = "00" + std::string("0002.00000") + "00" + "00";
    const double chip[4][2] = {{0.5, 0.5}, {0.5, 99.5}, {99.5, 0.5}, {99.5, 99.5}};
    for (const auto& point : chip)
        data += number(point[0]) + number(point[1]);
    for (const auto& point : chip)
        data += number(100 + 2 * point[0]) + number(200 + 2 * point[1]);
    return data + "00001000" + "00001000";
}
