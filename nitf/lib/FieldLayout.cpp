#include "FieldLayout.h"

#include <algorithm>
#include <cstring>
#include <mutex>
#include <set>

#include "DataStreamWrite.h"
#include "HostCompat.h"

CFieldLayout& CFieldLayout::add(const FieldSpec& field) {
    m_fields.push_back(field);
    return *this;
}

CFieldLayout& CFieldLayout::add(const CFieldLayout& other) {
    m_fields.insert(m_fields.end(), other.m_fields.begin(), other.m_fields.end());
    return *this;
}

static const char* textOf(const PropertyMap& map, const char* name) {
    CNitfProperty* property = FindProperty(map, name);
    if (!property || property->getDataType() != CNitfProperty::eString)
        return nullptr;
    return property->getAsString();
}

bool CFieldLayout::isPresent(const FieldSpec& field, const PropertyMap& map) {
    const FieldCondition& when = field.when;
    switch (when.kind) {
    case FieldCondition::Always:
        return true;
    case FieldCondition::Equals: {
        const char* text = textOf(map, when.field);
        return text && _stricmp(text, when.value) == 0;
    }
    case FieldCondition::NotEquals: {
        const char* text = textOf(map, when.field);
        return !text || _stricmp(text, when.value) != 0;
    }
    case FieldCondition::NotZero: {
        CNitfProperty* property = FindProperty(map, when.field);
        return property && property->getDataType() != CNitfProperty::eNone && property->getAsInt() != 0;
    }
    }
    return true;
}

int CFieldLayout::widthOf(const FieldSpec& field, const PropertyMap& map) {
    if (!field.widthField)
        return field.width;
    CNitfProperty* property = FindProperty(map, field.widthField);
    int width = property && property->getDataType() != CNitfProperty::eNone ? property->getAsInt() : 0;
    return width > 0 ? width : 0;
}

void CFieldLayout::read(FILE* fp, PropertyMap& map, std::vector<const char*>* order) const {
    for (const FieldSpec& field : m_fields) {
        if (!isPresent(field, map))
            continue;
        int width = widthOf(field, map);
        CNitfProperty* value = nullptr;
        switch (field.form) {
        case FieldForm::Text:
            value = CNitfProperty::getNewFromString(fp, width);
            break;
        case FieldForm::Bytes:
            value = CNitfProperty::getNewFromChars(fp, width);
            break;
        case FieldForm::Binary4:
            value = CNitfProperty::getNewFromUint4(fp);
            break;
        }
        SetProperty(map, field.name, value);
        if (order)
            order->push_back(field.name);
    }
}

void CFieldLayout::write(FILE* fp, PropertyMap& map) const {
    CDataStreamWrite out(fp);
    for (const FieldSpec& field : m_fields) {
        if (!isPresent(field, map))
            continue;
        int width = field.form == FieldForm::Binary4 ? 4 : widthOf(field, map);
        CNitfProperty* value = FindProperty(map, field.name);
        if (field.form == FieldForm::Binary4) {
            out.writeInt32(value && value->getDataType() == CNitfProperty::eInt4 ? value->getAsInt() : 0);
        } else if (value && value->getDataType() == CNitfProperty::eChars) {
            // Raw fields go out as their bytes, cut or zero-padded to the width.
            std::string bytes(static_cast<size_t>(width), '\0');
            size_t count = std::min<size_t>(bytes.size(), value->getLength());
            std::memcpy(&bytes[0], value->getBytes(), count);
            out.writeBytes(bytes.data(), bytes.size());
        } else if (value && value->getDataType() != CNitfProperty::eNone) {
            value->writeString(fp, width);
        } else {
            out.writeText("", width);
        }
    }
}

__int64 CFieldLayout::length(const PropertyMap& map) const {
    __int64 total = 0;
    for (const FieldSpec& field : m_fields) {
        if (isPresent(field, map))
            total += field.form == FieldForm::Binary4 ? 4 : widthOf(field, map);
    }
    return total;
}

const char* CFieldLayout::intern(const std::string& name) {
    static std::mutex guard;
    static std::set<std::string> names;
    std::lock_guard<std::mutex> lock(guard);
    return names.insert(name).first->c_str();
}

CFieldLayout CFieldLayout::security21(const char* prefix) {
    static const struct {
        const char* suffix;
        int width;
    } group[] = {{"CLAS", 1},  {"CLSY", 2}, {"CODE", 11}, {"CTLH", 2}, {"REL", 20},  {"DCTP", 2},
                 {"DCDT", 8},  {"DCXM", 4}, {"DG", 1},    {"DGDT", 8}, {"CLTX", 43}, {"CATP", 1},
                 {"CAUT", 40}, {"CRSN", 1}, {"SRDT", 8},  {"CTLN", 15}};
    CFieldLayout layout;
    for (const auto& field : group)
        layout.add({intern(std::string(prefix) + field.suffix), field.width});
    return layout;
}

CFieldLayout CFieldLayout::security20(const char* prefix, const char* controlName) {
    std::string p(prefix);
    const char* downgrade = intern(p + "DWNG");
    return CFieldLayout{
        {intern(p + "CLAS"), 1},
        {intern(p + "CODE"), 40},
        {controlName ? controlName : intern(p + "CTLH"), 40},
        {intern(p + "REL"), 40},
        {intern(p + "CAUT"), 20},
        {intern(p + "CTLN"), 20},
        {downgrade, 6},
        {intern(p + "DEVT"), 40, FieldForm::Text, whenEquals(downgrade, "999998")},
    };
}
