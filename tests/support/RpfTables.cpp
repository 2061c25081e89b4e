#include "RpfTables.h"

#include <cstdio>
#include <cstring>
#include <stdexcept>

#include "NitfFileReader.h"
#include "NitfSampleWriter.h"
#include "NitfTag.h"
#include "TestFiles.h"

RpfTestRectangle::RpfTestRectangle(const char* product, const char* scale, char zone, unsigned rows,
                                   unsigned columns, double southLatitude, double westLongitude,
                                   double frameDegrees, std::vector<std::string> frames)
    : paths(std::move(frames)) {
    std::strcpy(description.productDataType, product);
    std::strcpy(description.compressionRatio, "55:1");
    std::strcpy(description.scale, scale);
    description.zone = zone;
    std::strcpy(description.producer, "DMAAC");
    const double north = southLatitude + rows * frameDegrees;
    const double east = westLongitude + columns * frameDegrees * 1.25;
    description.upperLeftLatitude = north;
    description.upperLeftLongitude = westLongitude;
    description.lowerLeftLatitude = southLatitude;
    description.lowerLeftLongitude = westLongitude;
    description.upperRightLatitude = north;
    description.upperRightLongitude = east;
    description.lowerRightLatitude = southLatitude;
    description.lowerRightLongitude = east;
    description.verticalInterval = frameDegrees;
    description.horizontalInterval = frameDegrees * 1.25;
    description.verticalFrames = rows;
    description.horizontalFrames = columns;
    for (std::string& path : paths)
        table.push_back(path.empty() ? nullptr : &path[0]);
    description.frameCount = static_cast<int>(table.size());
    description.frameFiles = table.data();
}

RpfTestRectangles knownRpfRectangles() {
    RpfTestRectangles rectangles;
    rectangles.push_back(std::make_unique<RpfTestRectangle>(
        "CADRG", "1:1,000,000", '1', 3, 2, 28.0, -100.0, 2.0,
        std::vector<std::string>{"./RPF/ONC/001ZC013.ON1", "./RPF/ONC/001ZD013.ON1", "./RPF/TPC/001ZE013.ON1",
                                 "", "./RPF/ONC/001ZF013.ON1", "./RPF/TPC/001ZG013.ON1"}));
    rectangles.push_back(std::make_unique<RpfTestRectangle>("CIB", "10M", '2', 1, 1, 0.0, 0.0, 0.1,
                                                            std::vector<std::string>{"./001ALL26.I12"}));
    return rectangles;
}

CRpfSource builtRpfToc(const RpfTestRectangles& rectangles, long long header, long long location) {
    CRpfSource toc;
    toc.writeStart();
    for (const auto& rectangle : rectangles)
        toc.writeAddBoundaryRectangle(rectangle->description);
    toc.writePrepareHeaders(header, location);
    return toc;
}

namespace {

// Writes the table into the file at `path` where its header and location positions put it.
void writeInto(CRpfSource& toc, const std::string& path) {
    FILE* fp = std::fopen(path.c_str(), "r+b");
    if (!fp)
        throw std::runtime_error("cannot open " + path);
    toc.writeFinish(fp);
    std::fclose(fp);
}

} // namespace

std::string rawRpfToc(const RpfTestRectangles& rectangles) {
    CRpfSource toc = builtRpfToc(rectangles, 0, 48);
    TempFile file;
    writeInto(toc, file.path());
    return file.read();
}

std::string nitfWrappedRpfToc(const RpfTestRectangles& rectangles) {
    // The file is laid out with room for the sections, which are then written where it put them.
    CRpfSource sizing = builtRpfToc(rectangles, 0, 0);
    nitfsample::File file;
    file.version = "NITF02.00";
    file.udhd = {{"RPFHDR", std::string(static_cast<size_t>(sizing.computeTagLength()), '\0')}};
    file.des = {nitfsample::treOverflow(
        "UDHD", 0, {{"RPFDES", std::string(static_cast<size_t>(sizing.computeComponentsLength()), '\0')}},
        "NITF02.00")};
    TempFile nitf(nitfsample::build(file));
    long long header = 0, body = 0;
    {
        CNitfFileReader reader;
        if (!reader.open(nitf.path().c_str()))
            throw std::runtime_error("cannot open " + nitf.path());
        CNitfTag* tag = CNitfTag::find("RPFHDR", reader.getFileHeader()->getTaggedRecords());
        header = tag ? tag->getDataOffset() : 0;
        // The DES data: "RPFDES", its 5-digit length, then the sections.
        body = reader.getFileHeader()->getDataExtensionHeaderDataPair(0)->getDataOffset() + 11;
    }
    CRpfSource toc = builtRpfToc(rectangles, header, body);
    writeInto(toc, nitf.path());
    return nitf.read();
}
