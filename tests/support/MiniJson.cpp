#include "MiniJson.h"

#include <cstdlib>
#include <stdexcept>

class JsonValue::Parser {
public:
    explicit Parser(const std::string& text) : m_text(text) {}

    JsonValue document() {
        JsonValue value = parseValue();
        skipBlanks();
        if (m_at != m_text.size())
            fail("text after the document");
        return value;
    }

private:
    [[noreturn]] void fail(const char* what) const {
        throw std::runtime_error(std::string("JSON: ") + what + " at offset " + std::to_string(m_at));
    }

    void skipBlanks() {
        while (m_at < m_text.size() &&
               (m_text[m_at] == ' ' || m_text[m_at] == '\n' || m_text[m_at] == '\r' || m_text[m_at] == '\t'))
            ++m_at;
    }

    char peek() {
        skipBlanks();
        if (m_at >= m_text.size())
            fail("unexpected end");
        return m_text[m_at];
    }

    void expect(char c) {
        if (peek() != c)
            fail("unexpected character");
        ++m_at;
    }

    bool literal(const char* word) {
        size_t n = std::char_traits<char>::length(word);
        if (m_text.compare(m_at, n, word) != 0)
            return false;
        m_at += n;
        return true;
    }

    JsonValue parseValue() {
        JsonValue value;
        char c = peek();
        if (c == '{') {
            value.m_type = Object;
            ++m_at;
            if (peek() == '}') {
                ++m_at;
                return value;
            }
            do {
                std::string key = parseString();
                expect(':');
                value.m_members.emplace_back(std::move(key), parseValue());
            } while (next(','));
            expect('}');
        } else if (c == '[') {
            value.m_type = Array;
            ++m_at;
            if (peek() == ']') {
                ++m_at;
                return value;
            }
            do
                value.m_items.push_back(parseValue());
            while (next(','));
            expect(']');
        } else if (c == '"') {
            value.m_type = String;
            value.m_string = parseString();
        } else if (literal("true") || literal("false")) {
            value.m_type = Bool;
            value.m_bool = m_text[m_at - 1] == 'e' && m_text[m_at - 2] == 'u';
        } else if (literal("null")) {
            value.m_type = Null;
        } else {
            const char* begin = m_text.c_str() + m_at;
            char* end = nullptr;
            value.m_number = std::strtod(begin, &end);
            if (end == begin)
                fail("not a value");
            value.m_type = Number;
            m_at += static_cast<size_t>(end - begin);
        }
        return value;
    }

    bool next(char separator) {
        if (peek() != separator)
            return false;
        ++m_at;
        return true;
    }

    std::string parseString() {
        expect('"');
        std::string out;
        while (true) {
            if (m_at >= m_text.size())
                fail("unterminated string");
            char c = m_text[m_at++];
            if (c == '"')
                return out;
            if (c != '\\') {
                out += c;
                continue;
            }
            if (m_at >= m_text.size())
                fail("unterminated escape");
            char e = m_text[m_at++];
            switch (e) {
            case 'n':
                out += '\n';
                break;
            case 't':
                out += '\t';
                break;
            case 'r':
                out += '\r';
                break;
            case 'b':
                out += '\b';
                break;
            case 'f':
                out += '\f';
                break;
            case 'u':
                out += utf8(parseHex4());
                break;
            default: // " \ /
                out += e;
            }
        }
    }

    unsigned parseHex4() {
        if (m_at + 4 > m_text.size())
            fail("short \\u escape");
        unsigned code = static_cast<unsigned>(std::strtoul(m_text.substr(m_at, 4).c_str(), nullptr, 16));
        m_at += 4;
        return code;
    }

    // Code points of the basic plane (surrogate pairs are not joined: the manifest does not need them).
    static std::string utf8(unsigned code) {
        std::string out;
        if (code < 0x80) {
            out += static_cast<char>(code);
        } else if (code < 0x800) {
            out += static_cast<char>(0xC0 | (code >> 6));
            out += static_cast<char>(0x80 | (code & 0x3F));
        } else {
            out += static_cast<char>(0xE0 | (code >> 12));
            out += static_cast<char>(0x80 | ((code >> 6) & 0x3F));
            out += static_cast<char>(0x80 | (code & 0x3F));
        }
        return out;
    }

    const std::string& m_text;
    size_t m_at = 0;
};

JsonValue JsonValue::parse(const std::string& text) {
    return Parser(text).document();
}

const JsonValue& JsonValue::operator[](const std::string& key) const {
    static const JsonValue none;
    for (const auto& member : m_members) {
        if (member.first == key)
            return member.second;
    }
    return none;
}

bool JsonValue::has(const std::string& key) const {
    for (const auto& member : m_members) {
        if (member.first == key)
            return true;
    }
    return false;
}
