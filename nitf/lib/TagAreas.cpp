#include "TagAreas.h"

#include <cstring>

#include "HostFile.h"

const record::Placed* findPlace(const std::vector<record::Placed>& places, const char* name) {
    for (const record::Placed& place : places) {
        if (std::strcmp(place.entry->name, name) == 0)
            return &place;
    }
    return nullptr;
}

void readTagAreas(const std::vector<record::Placed>& places, std::initializer_list<const char*> areas,
                  CNitfTag::eTagSource_t source, std::list<CNitfTag*>& list) {
    for (const char* name : areas) {
        const record::Placed* area = findPlace(places, name);
        if (area)
            CNitfTag::readArea(area->bytes.data(), static_cast<long long>(area->bytes.size()), area->offset,
                               source, list, true);
    }
}

void writeTagArea(FILE* fp, const std::vector<record::Placed>& places, const char* name,
                  std::list<CNitfTag*>& tags) {
    const record::Placed* area = findPlace(places, name);
    if (!area || tags.empty())
        return;
    __int64 end = DKFTell(fp);
    DKFSeek64(fp, area->offset, SEEK_SET);
    for (CNitfTag* tag : tags)
        tag->write(fp);
    DKFSeek64(fp, end, SEEK_SET);
}
