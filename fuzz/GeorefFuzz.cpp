// Feeds arbitrary bytes to the georeferencing: IGEOLO in the form the first byte chooses, and BLOCKA and
// GEOLOB data after it, read into a projection record (precise or not) and, when that gives corners, written
// back.
#include <cstdint>
#include <cstdio>
#include <vector>

#include "HostError.h"
#include "NitfGeorefInfo.h"
#include "NitfImageSubheaderV21.h"
#include "NitfTag.h"

namespace {

const char kIcords[] = {'G', 'D', 'N', 'S', 'U', 'C', 'P', ' ', 'X'};

void addTag(CNitfImageSubheader& subheader, const char* name, long long offset, long long length) {
    CNitfTag* tag = new CNitfTag;
    tag->setIdentifier(name);
    tag->setSource(CNitfTag::eTagSourceImage);
    tag->setDataOffset(offset);
    tag->setDataLength(length);
    subheader.getTaggedRecords().push_back(tag);
}

} // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
    // Damaged corners are warned about on every input: the messages are not what is being tested.
    static const bool silenced = [] {
        vexo::nspio::Warning::setHandler([](const char*, const char*, int) {});
        return true;
    }();
    (void)silenced;
    if (size < 5)
        return 0;
    const uint8_t choice = data[0];
    const int width = 1 + (data[1] | (data[2] << 8));
    const int height = 1 + (data[3] | (data[4] << 8));
    const uint8_t* body = data + 5;
    const size_t bodySize = size - 5;
    FILE* fp = fmemopen(const_cast<uint8_t*>(body), bodySize, "rb");
    if (!fp)
        return 0;

    // The body: IGEOLO, then BLOCKA's 123 bytes, then GEOLOB's 48 (each as far as the input reaches; the
    // tags claim their full length so that short data is met too).
    CNitfImageSubheaderV21 subheader;
    CNitfGeorefInfo& georef = subheader.getGeorefSource();
    georef.setCoordinateType(kIcords[choice % sizeof kIcords],
                             choice & 0x80 ? eNitfVersion20 : eNitfVersion21);
    georef.setIgeoloOffset(0);
    if (choice & 0x10)
        addTag(subheader, "BLOCKA", 60, 123);
    if (choice & 0x20)
        addTag(subheader, "GEOLOB", 183, choice & 0x40 ? 40 : 48);

    ProjInfo_t record;
    georef.read(fp, &subheader, &record, width, height, (choice & 0x08) != 0);
    std::fclose(fp);

    if (record.hasCorners) {
        std::vector<char> out(64);
        FILE* written = fmemopen(out.data(), out.size(), "w+b");
        if (written) {
            try {
                georef.write(written, &record, width, height);
            } catch (const vexo::Exception&) {
            }
            std::fclose(written);
        }
    }
    return 0;
}
