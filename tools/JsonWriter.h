// A small streaming JSON writer: objects and arrays nest, commas and indentation are handled here.
#pragma once

#include <cstdio>
#include <string>
#include <vector>

class JsonWriter {
public:
    explicit JsonWriter(FILE* out) : m_out(out) {}

    void beginObject(const char* key = nullptr) { open(key, '{'); }
    void endObject() { close('}'); }
    void beginArray(const char* key = nullptr) { open(key, '['); }
    void endArray() { close(']'); }

    void value(const char* key, const std::string& text);
    void value(const char* key, long long number);
    void value(const char* key, bool flag);
    // Ends the document with a newline.
    void finish() { std::fputc('\n', m_out); }

    // Text as a JSON string literal; bytes outside printable ASCII become \u00XX.
    static std::string quote(const std::string& text);

private:
    void open(const char* key, char bracket);
    void close(char bracket);
    void startItem(const char* key);

    FILE* m_out;
    std::vector<bool> m_hasItems;
};
