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
