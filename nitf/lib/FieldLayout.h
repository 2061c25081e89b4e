// The fixed-width field layouts of headers and sub-headers, as data. One layout per header kind and version
// is walked by one reader, one writer and one length counter, so the three agree by construction.
#pragma once

#include <cstdio>
#include <initializer_list>
#include <string>
#include <vector>

#include "NitfProperty.h"

// How a field's bytes are kept in the property map.
enum class FieldForm {
    Text,    // text of the field's width, blanks kept
    Bytes,   // raw bytes (eChars)
    Binary4, // a 4-byte big-endian binary value (eInt4)
};

// When a field is present, judged on the fields read before it.
struct FieldCondition {
    enum Kind {
        Always,
        Equals,    // the text of `field` equals `value`, ignoring case
        NotEquals, // the text of `field` does not equal `value`, ignoring case
        NotZero,   // the integer value of `field` is not 0
    };
    Kind kind = Always;
    const char* field = nullptr;
    const char* value = nullptr;
};

struct FieldSpec {
    const char* name;
    int width; // bytes, when widthField is null
    FieldForm form = FieldForm::Text;
    FieldCondition when = {};
    const char* widthField = nullptr; // the width is the integer value of this earlier field
};

class CFieldLayout {
public:
    CFieldLayout() = default;
    CFieldLayout(std::initializer_list<FieldSpec> fields) : m_fields(fields) {}

    CFieldLayout& add(const FieldSpec& field);
    CFieldLayout& add(const CFieldLayout& other);

    // Reads every present field at the stream's position into `map` (replacing earlier values of the same
    // names) and appends the names read to `order`, when given.
    void read(FILE* fp, PropertyMap& map, std::vector<const char*>* order = nullptr) const;
    // Writes every present field from `map`; a field missing from the map is written as blanks.
    void write(FILE* fp, PropertyMap& map) const;
    // Bytes `write` produces for `map`.
    __int64 length(const PropertyMap& map) const;

    const std::vector<FieldSpec>& fields() const { return m_fields; }

    // A name that lives as long as the program (for layouts built from prefixes, such as security groups).
    static const char* intern(const std::string& name);

    // The security group of a 2.1-family header or sub-header with the given prefix ("FS", "IS", "DES", ...).
    static CFieldLayout security21(const char* prefix);
    // The NITF 2.0 security group, with the downgrading event present only for the downgrade code "999998".
    // `controlName` replaces the control-and-handling field's name when given.
    static CFieldLayout security20(const char* prefix, const char* controlName = nullptr);

private:
    static bool isPresent(const FieldSpec& field, const PropertyMap& map);
    static int widthOf(const FieldSpec& field, const PropertyMap& map);

    std::vector<FieldSpec> m_fields;
};

// Shorthands for layout tables.
inline FieldCondition whenEquals(const char* field, const char* value) {
    return {FieldCondition::Equals, field, value};
}
inline FieldCondition whenNotEquals(const char* field, const char* value) {
    return {FieldCondition::NotEquals, field, value};
}
inline FieldCondition whenNotZero(const char* field) {
    return {FieldCondition::NotZero, field, nullptr};
}
