// A small JSON reader for the test corpus manifest: objects (keys kept in file order), arrays, strings,
// numbers, true/false/null. Enough for reading, not a general-purpose library.
#pragma once

#include <memory>
#include <string>
#include <utility>
#include <vector>

class JsonValue {
public:
    enum Type { Null, Bool, Number, String, Array, Object };

    // Parses a whole document; throws std::runtime_error with the offset of the first fault.
    static JsonValue parse(const std::string& text);

    Type type() const { return m_type; }
    bool isNull() const { return m_type == Null; }
    bool isObject() const { return m_type == Object; }
    bool isArray() const { return m_type == Array; }
    bool isString() const { return m_type == String; }
    bool isNumber() const { return m_type == Number; }

    double number() const { return m_number; }
    long long integer() const { return static_cast<long long>(m_number); }
    bool boolean() const { return m_bool; }
    const std::string& string() const { return m_string; }
    const std::vector<JsonValue>& items() const { return m_items; }
    const std::vector<std::pair<std::string, JsonValue>>& members() const { return m_members; }

    // The member of that key, or a shared null value when there is none (or this is not an object).
    const JsonValue& operator[](const std::string& key) const;
    bool has(const std::string& key) const;

private:
    class Parser;

    Type m_type = Null;
    bool m_bool = false;
    double m_number = 0;
    std::string m_string;
    std::vector<JsonValue> m_items;
    std::vector<std::pair<std::string, JsonValue>> m_members;
};
