#include "JsonWriter.h"

std::string JsonWriter::quote(const std::string& text) {
    std::string out = "\"";
    for (unsigned char c : text) {
        if (c == '"' || c == '\\') {
            out += '\\';
            out += static_cast<char>(c);
        } else if (c < 0x20 || c > 0x7E) {
            char escaped[8];
            std::snprintf(escaped, sizeof escaped, "\\u%04x", c);
            out += escaped;
        } else {
            out += static_cast<char>(c);
        }
    }
    return out + "\"";
}

void JsonWriter::startItem(const char* key) {
    if (!m_hasItems.empty()) {
        std::fputs(m_hasItems.back() ? ",\n" : "\n", m_out);
        m_hasItems.back() = true;
        std::fprintf(m_out, "%*s", static_cast<int>(2 * m_hasItems.size()), "");
    }
    if (key)
        std::fprintf(m_out, "%s: ", quote(key).c_str());
}

void JsonWriter::open(const char* key, char bracket) {
    startItem(key);
    std::fputc(bracket, m_out);
    m_hasItems.push_back(false);
}

void JsonWriter::close(char bracket) {
    bool hadItems = m_hasItems.back();
    m_hasItems.pop_back();
    if (hadItems)
        std::fprintf(m_out, "\n%*s", static_cast<int>(2 * m_hasItems.size()), "");
    std::fputc(bracket, m_out);
}

void JsonWriter::value(const char* key, const std::string& text) {
    startItem(key);
    std::fputs(quote(text).c_str(), m_out);
}

void JsonWriter::value(const char* key, long long number) {
    startItem(key);
    std::fprintf(m_out, "%lld", number);
}

void JsonWriter::value(const char* key, bool flag) {
    startItem(key);
    std::fputs(flag ? "true" : "false", m_out);
}
