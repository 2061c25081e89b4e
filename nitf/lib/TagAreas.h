// The TRE areas of headers and sub-headers. A layout describes an area as its 5-digit length, then, when that
// is not 0, the 3-digit overflow number and the area's bytes, neither kept in the map: these read the TREs at
// the places the walk reported.
#pragma once

#include <cstdio>
#include <initializer_list>
#include <list>
#include <vector>

#include "NitfTag.h"
#include "RecordLayout.h"

// The placed field named `name`, or null.
const record::Placed* findPlace(const std::vector<record::Placed>& places, const char* name);

// Reads the TREs of every placed field named in `areas` (fields marked kLoaded), in file order, into `list`
// with `source`, numbered by occurrence.
void readTagAreas(const std::vector<record::Placed>& places, std::initializer_list<const char*> areas,
                  CNitfTag::eTagSource_t source, std::list<CNitfTag*>& list);

// Writes the TRE headers of `tags` at the placed field named `area` (the data bytes are the caller's to put
// at each tag's new data offset); the stream is left where it stood.
void writeTagArea(FILE* fp, const std::vector<record::Placed>& places, const char* area,
                  std::list<CNitfTag*>& tags);
