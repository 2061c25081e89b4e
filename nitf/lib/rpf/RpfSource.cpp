#include "RpfSource.h"

#include <algorithm>
#include <climits>
#include <cmath>
#include <cstring>
#include <strings.h>
#include <vector>

#include "HostFile.h"
#include "HostMemory.h"
#include "NitfTag.h"
#include "Raise.h"
#include "SerializerFileRaw.h"
#include "SerializerQuery.h"

static const char kSourceFile[] = "nitf/lib/rpf/RpfSource";

using nitf::CBinaryFields;
using nitf::CRpfBoundaryRectangleRecord;
using nitf::CRpfFrameFileIndexRecord;
using nitf::CRpfPathnameRecord;
using nitf::CRpfToc;

namespace {

const unsigned char kBigEndian = 0x00;
const unsigned char kLittleEndian = 0xFF;

bool hostIsLittleEndian() {
    return __BYTE_ORDER__ == __ORDER_LITTLE_ENDIAN__;
}

// The frame tables of the descriptions are as long as their grids reach: a grid far larger than its frames
// comes from a damaged table (a frame table entry is a pointer, a frame record 33 bytes of the file).
const long long kFrameTableAllowance = 1 << 20;
const long long kFrameTableEntriesPerFrame = 64;

// Beyond any frame table the allowance lets through: where damaged grids' indexes stop growing.
const long long kLargestIndex = 1LL << 40;

// Entry of a frame in its rectangle's frame table: row by row from the north-west corner. Grids of up to
// 2^32 x 2^32 cells fit 64 unsigned bits; a frame outside its grid, or an index past kLargestIndex, gives
// kLargestIndex, which the frame table check refuses.
long long frameTableIndex(const CRpfBoundaryRectangleRecord& rectangle,
                          const CRpfFrameFileIndexRecord& frame) {
    if (frame.row >= rectangle.verticalFrames || frame.column >= rectangle.horizontalFrames)
        return kLargestIndex;
    const unsigned long long rowsBelow = rectangle.verticalFrames - 1ULL - frame.row;
    const unsigned long long index = rowsBelow * rectangle.horizontalFrames + frame.column;
    return index > static_cast<unsigned long long>(kLargestIndex) ? kLargestIndex
                                                                  : static_cast<long long>(index);
}

// The frame table length of each rectangle: one past its last frame's entry.
std::vector<long long> frameTableLengths(const CRpfToc& toc) {
    std::vector<long long> lengths(toc.rectangles.size(), 0);
    for (const CRpfFrameFileIndexRecord& frame : toc.frames) {
        long long& length = lengths[frame.boundaryRectangle];
        length = std::max(length, frameTableIndex(toc.rectangles[frame.boundaryRectangle], frame) + 1);
    }
    return lengths;
}

template <size_t N> void copyText(char (&out)[N], const std::string& text) {
    const size_t length = std::min(text.size(), N - 1);
    text.copy(out, length);
    out[length] = '\0';
}

char* newText(const std::string& text) {
    char* copy = static_cast<char*>(HMalloc(text.size() + 1));
    std::memcpy(copy, text.c_str(), text.size() + 1);
    return copy;
}

} // namespace

CRpfSource::CRpfSource() : m_rectangleCount(0), m_headerPosition(0) {}

// ---- reading ----------------------------------------------------------------------------------------------

void CRpfSource::readStart(FILE* fp, CNitfTag* tag) {
    if (!tag)
        NITF_RAISE("The file has no RPF header section",
                   "void __cdecl CRpfSource::readStart(" NITF_FILE_SIG ",class CNitfTag *)");
    readStartAt(fp, tag->getDataOffset());
}

bool CRpfSource::swappingAt(FILE* fp, __int64 offset) {
    static const char signature[] = "bool __cdecl CRpfSource::swappingAt(" NITF_FILE_SIG ",__int64)";
    unsigned char byteOrder = 0;
    if (!fp || DKFSeek64(fp, offset, SEEK_SET) != 0 || DKFRead(&byteOrder, 1, 1, fp) != 1)
        NITF_RAISE_FORMAT(signature, "The RPF header section at byte %lld cannot be read", offset);
    if (byteOrder != kBigEndian && byteOrder != kLittleEndian)
        NITF_RAISE_FORMAT(signature, "Unknown RPF byte order indicator 0x%02X", byteOrder);
    return (byteOrder == kBigEndian) == hostIsLittleEndian();
}

void CRpfSource::readHeaderSection(FILE* fp, __int64 offset, nitf::CRpfHeaderSection& header) {
    nitf::CSerializerFileRaw in(fp, swappingAt(fp, offset));
    in.seek(offset);
    in >> header;
}

void CRpfSource::readStartAt(FILE* fp, __int64 headerOffset) {
    nitf::CSerializerFileRaw in(fp, swappingAt(fp, headerOffset));
    in.seek(headerOffset);
    m_toc = CRpfToc();
    in >> m_toc;
    m_toc.resolvePathnames();
    m_toc.checkFrames();
    checkFrameTables();
    m_rectangleCount = static_cast<int>(m_toc.rectangles.size());
    m_headerPosition = headerOffset;
}

void CRpfSource::checkFrameTables() const {
    long long total = 0;
    for (long long length : frameTableLengths(m_toc))
        total = std::min(total + length, kLargestIndex); // each length is at most kLargestIndex + 1
    const long long allowed = std::max(kFrameTableAllowance, kFrameTableEntriesPerFrame *
                                                                 static_cast<long long>(m_toc.frames.size()));
    if (total >= kLargestIndex || total > allowed)
        NITF_RAISE_FORMAT(
            "void __cdecl CRpfSource::checkFrameTables(void)",
            "The RPF boundary rectangles' frame grids (%lld cells) are far larger than their %zu "
            "frames",
            total, m_toc.frames.size());
}

RPFBoundaryRectangle_t** CRpfSource::readRpfBoundaries(FILE*) {
    checkFrameTables();
    const std::vector<long long> lengths = frameTableLengths(m_toc);
    const size_t count = m_toc.rectangles.size();
    auto** boundaries =
        static_cast<RPFBoundaryRectangle_t**>(HCalloc(count + 1, sizeof(RPFBoundaryRectangle_t*)));
    for (size_t n = 0; n < count; ++n) {
        const CRpfBoundaryRectangleRecord& record = m_toc.rectangles[n];
        auto* rectangle = static_cast<RPFBoundaryRectangle_t*>(HCalloc(1, sizeof(RPFBoundaryRectangle_t)));
        boundaries[n] = rectangle;
        copyText(rectangle->productDataType, nitf::textOf(record.productDataType));
        copyText(rectangle->compressionRatio, nitf::textOf(record.compressionRatio));
        copyText(rectangle->scale, nitf::textOf(record.scale));
        rectangle->zone = record.zone[0];
        copyText(rectangle->producer, nitf::textOf(record.producer));
        rectangle->upperLeftLatitude = record.upperLeftLatitude;
        rectangle->upperLeftLongitude = record.upperLeftLongitude;
        rectangle->lowerLeftLatitude = record.lowerLeftLatitude;
        rectangle->lowerLeftLongitude = record.lowerLeftLongitude;
        rectangle->upperRightLatitude = record.upperRightLatitude;
        rectangle->upperRightLongitude = record.upperRightLongitude;
        rectangle->lowerRightLatitude = record.lowerRightLatitude;
        rectangle->lowerRightLongitude = record.lowerRightLongitude;
        rectangle->verticalInterval = record.verticalInterval * kFramePixels;
        rectangle->horizontalInterval = record.horizontalInterval * kFramePixels;
        rectangle->verticalFrames = record.verticalFrames;
        rectangle->horizontalFrames = record.horizontalFrames;
        rectangle->frameCount = static_cast<int>(lengths[n]);
        rectangle->frameFiles =
            static_cast<char**>(HCalloc(static_cast<size_t>(lengths[n]) + 1, sizeof(char*)));
    }
    for (const CRpfFrameFileIndexRecord& frame : m_toc.frames) {
        if (frame.pathname < 0)
            continue;
        const CRpfBoundaryRectangleRecord& record = m_toc.rectangles[frame.boundaryRectangle];
        char*& entry = boundaries[frame.boundaryRectangle]->frameFiles[frameTableIndex(record, frame)];
        free(entry); // a second record for the same place replaces the first
        entry = newText(m_toc.pathnames[frame.pathname].text + nitf::textOf(frame.fileName));
    }
    return boundaries;
}

void CRpfSource::freeRpfBoundaries(RPFBoundaryRectangle_t** boundaries) {
    if (!boundaries)
        return;
    for (RPFBoundaryRectangle_t** rectangle = boundaries; *rectangle; ++rectangle) {
        for (int i = 0; i < (*rectangle)->frameCount; ++i)
            free((*rectangle)->frameFiles[i]);
        free((*rectangle)->frameFiles);
        free(*rectangle);
    }
    free(boundaries);
}

bool CRpfSource::isRawToc(FILE* fp) {
    unsigned char start[15];
    if (!fp || DKFSeek64(fp, 0, SEEK_SET) != 0 || DKFRead(start, 1, sizeof start, fp) != sizeof start)
        return false;
    const bool bigEndian = start[0] == kBigEndian && start[1] == 0 && start[2] == 48;
    const bool littleEndian = start[0] == kLittleEndian && start[1] == 48 && start[2] == 0;
    nitf::FixedText<12> name;
    std::memcpy(name.data(), start + 3, name.size());
    return (bigEndian || littleEndian) && strcasecmp(nitf::textOf(name).c_str(), "A.TOC") == 0;
}

// ---- the geographic location code -------------------------------------------------------------------------

std::string CRpfSource::getGeographicLocation(double latitude, double longitude) {
    // Letters without I and O. A longitude of 180 degrees east reaches cell 24, one past the last letter,
    // which gives the alphabet's terminating NUL: the limit is kept as the code has always had it.
    static const char letters[] = "ABCDEFGHJKLMNPQRSTUVWXYZ";
    static const char digits[] = "0123456789";
    auto limited = [](double value, int last) {
        const double index = std::floor(value);
        return static_cast<int>(std::isnan(index) ? 0 : std::min<double>(std::max(index, 0.0), last));
    };
    const double east = longitude + 180, north = latitude + 90;
    const int longitudeCell = limited(east / 15, 24), latitudeCell = limited(north / 15, 12);
    const double eastInCell = east - 15.0 * longitudeCell, northInCell = north - 15.0 * latitudeCell;
    const int longitudeDegrees = limited(eastInCell, 15), latitudeDegrees = limited(northInCell, 15);
    std::string code;
    code += letters[longitudeCell];
    code += letters[latitudeCell];
    code += letters[longitudeDegrees];
    code += letters[latitudeDegrees];
    code += digits[limited(10 * (eastInCell - longitudeDegrees), 9)];
    code += digits[limited(10 * (northInCell - latitudeDegrees), 9)];
    return code;
}

// ---- writing ----------------------------------------------------------------------------------------------

template <class Fields> __int64 CRpfSource::measure(Fields fields) {
    nitf::CSerializerQuery query;
    CBinaryFields driver(query, CBinaryFields::eWrite);
    fields(driver);
    return query.tell();
}

void CRpfSource::writeStart() {
    m_toc = CRpfToc();
    m_rectangleCount = 0;
    m_headerPosition = 0;
    nitf::CRpfHeaderSection& header = m_toc.header;
    header.byteOrder = kBigEndian;
    // Readers recognise a raw A.TOC by its name, which every one seen stores right-justified.
    header.fileName = nitf::makeText<12>("A.TOC", true);
    header.newReplacementUpdate = 0;
    header.standardNumber = nitf::makeText<15>("MIL-STD-2411");
    header.standardDate = nitf::makeText<8>("1994");
    header.classification = nitf::makeText<1>("U");
    header.countryCode = nitf::makeText<2>("CA");
    header.releaseMarking = nitf::makeText<2>("DS");
    header.headerSectionLength = static_cast<unsigned short>(measure([&](CBinaryFields& f) { f(header); }));
    m_toc.frameIndexSection.classification = nitf::makeText<1>("U");
    for (unsigned short id = CRpfToc::kBoundaryRectangleSection; id <= CRpfToc::kFrameFileIndex; ++id) {
        nitf::CRpfComponentLocation component;
        component.id = id;
        component.length =
            static_cast<unsigned int>(measure([&](CBinaryFields& f) { m_toc.componentFields(f, id); }));
        m_toc.location.components.push_back(component);
    }
    m_toc.location.recordCount = static_cast<unsigned short>(m_toc.location.components.size());
}

int CRpfSource::writeAddBoundaryRectangle(const RPFBoundaryRectangle_t& description) {
    static const char signature[] =
        "int __cdecl CRpfSource::writeAddBoundaryRectangle(const struct RPFBoundaryRectangle_t &)";
    if (m_rectangleCount >= USHRT_MAX)
        NITF_RAISE_FORMAT(signature, "An RPF table of contents holds at most %d boundary rectangles",
                          USHRT_MAX);
    const long long cells = static_cast<long long>(description.verticalFrames) *
                            static_cast<long long>(description.horizontalFrames);
    const bool gridFitsRecords =
        description.verticalFrames <= USHRT_MAX + 1u && description.horizontalFrames <= USHRT_MAX + 1u;
    if (description.frameCount > 0 && !gridFitsRecords)
        NITF_RAISE_FORMAT(signature, "Frame grids of %u x %u frames have rows or columns beyond 65535",
                          description.verticalFrames, description.horizontalFrames);
    if (description.frameCount > cells)
        NITF_RAISE_FORMAT(signature, "%d frames do not fit a grid of %u x %u frames", description.frameCount,
                          description.verticalFrames, description.horizontalFrames);

    CRpfBoundaryRectangleRecord record;
    record.productDataType = nitf::makeText<5>(description.productDataType);
    record.compressionRatio = nitf::makeText<5>(description.compressionRatio);
    record.scale = nitf::makeText<12>(description.scale);
    record.zone = nitf::makeText<1>(std::string(1, description.zone));
    record.producer = nitf::makeText<5>(description.producer);
    record.upperLeftLatitude = description.upperLeftLatitude;
    record.upperLeftLongitude = description.upperLeftLongitude;
    record.lowerLeftLatitude = description.lowerLeftLatitude;
    record.lowerLeftLongitude = description.lowerLeftLongitude;
    record.upperRightLatitude = description.upperRightLatitude;
    record.upperRightLongitude = description.upperRightLongitude;
    record.lowerRightLatitude = description.lowerRightLatitude;
    record.lowerRightLongitude = description.lowerRightLongitude;
    record.verticalInterval = description.verticalInterval / kFramePixels;
    record.horizontalInterval = description.horizontalInterval / kFramePixels;
    record.verticalFrames = description.verticalFrames;
    record.horizontalFrames = description.horizontalFrames;

    const int number = m_rectangleCount;
    for (int i = 0; i < description.frameCount; ++i) {
        const char* path = description.frameFiles ? description.frameFiles[i] : nullptr;
        if (!path)
            continue;
        const std::string full(path);
        const size_t slash = full.find_last_of("/\\");
        // A bare file name lies beside the table of contents.
        const std::string directory = slash == std::string::npos ? "./" : full.substr(0, slash + 1);
        const std::string name = slash == std::string::npos ? full : full.substr(slash + 1);
        if (name.empty() || name.size() > 12)
            NITF_RAISE_FORMAT(signature, "RPF frame file names have 1 to 12 characters (\"%s\")",
                              name.c_str());
        if (directory.size() > CRpfPathnameRecord::kLongestText)
            NITF_RAISE_FORMAT(signature, "RPF pathnames have at most %u characters (\"%s\")",
                              CRpfPathnameRecord::kLongestText, directory.c_str());

        CRpfFrameFileIndexRecord frame;
        frame.boundaryRectangle = static_cast<unsigned short>(number);
        // Frames are listed from the top row down; rows count from the bottom.
        frame.row =
            static_cast<unsigned short>(description.verticalFrames - i / description.horizontalFrames - 1);
        frame.column = static_cast<unsigned short>(i % description.horizontalFrames);
        frame.fileName = nitf::makeText<12>(name);
        frame.geographicLocation = nitf::makeText<6>(getGeographicLocation(
            frame.row * description.verticalInterval + description.lowerLeftLatitude,
            frame.column * description.horizontalInterval + description.lowerLeftLongitude));
        frame.classification = nitf::makeText<1>("U");
        frame.countryCode = nitf::makeText<2>("CA");
        frame.releaseMarking = nitf::makeText<2>("DS");
        auto shared =
            std::find_if(m_toc.pathnames.begin(), m_toc.pathnames.end(),
                         [&](const CRpfPathnameRecord& pathname) { return pathname.text == directory; });
        if (shared == m_toc.pathnames.end()) {
            if (m_toc.pathnames.size() >= USHRT_MAX)
                NITF_RAISE_FORMAT(signature, "An RPF table of contents holds at most %d pathnames",
                                  USHRT_MAX);
            CRpfPathnameRecord pathname;
            pathname.length = static_cast<unsigned short>(directory.size());
            pathname.text = directory;
            m_toc.pathnames.push_back(pathname);
            shared = m_toc.pathnames.end() - 1;
        }
        frame.pathname = static_cast<int>(shared - m_toc.pathnames.begin());
        m_toc.frames.push_back(frame);
    }
    m_toc.frameIndexSection.recordCount = static_cast<unsigned int>(m_toc.frames.size());
    m_toc.frameIndexSection.pathnameCount = static_cast<unsigned short>(m_toc.pathnames.size());
    m_toc.rectangles.push_back(record);
    m_toc.rectangleSection.recordCount = static_cast<unsigned short>(m_toc.rectangles.size());
    ++m_rectangleCount;
    return number;
}

void CRpfSource::writePrepareHeaders(__int64 headerPosition, __int64 locationPosition) {
    static const char signature[] = "void __cdecl CRpfSource::writePrepareHeaders(__int64,__int64)";
    if (headerPosition < 0 || locationPosition < 0 || locationPosition > UINT_MAX)
        NITF_RAISE_FORMAT(signature, "RPF sections cannot be placed at bytes %lld and %lld", headerPosition,
                          locationPosition);
    m_headerPosition = headerPosition;
    m_toc.header.locationSectionLocation = static_cast<unsigned int>(locationPosition);
    m_toc.rectangleSection.recordLength = static_cast<unsigned short>(measure([](CBinaryFields& f) {
        CRpfBoundaryRectangleRecord r;
        f(r);
    }));
    m_toc.frameIndexSection.recordLength = static_cast<unsigned short>(measure([](CBinaryFields& f) {
        CRpfFrameFileIndexRecord r;
        f(r);
    }));
    m_toc.assignPathnameOffsets();

    // The components follow the location section, each where the previous one ends.
    nitf::CRpfLocationSection& location = m_toc.location;
    location.sectionLength = static_cast<unsigned short>(measure([&](CBinaryFields& f) { f(location); }));
    __int64 position = locationPosition + location.sectionLength;
    __int64 aggregate = 0;
    for (nitf::CRpfComponentLocation& component : location.components) {
        const __int64 length = measure([&](CBinaryFields& f) { m_toc.componentFields(f, component.id); });
        if (position + length > UINT_MAX)
            NITF_RAISE_FORMAT(signature, "The RPF component %u would end beyond byte %u", component.id,
                              UINT_MAX);
        component.length = static_cast<unsigned int>(length);
        component.location = static_cast<unsigned int>(position);
        position += length;
        aggregate += length;
    }
    location.aggregateLength = static_cast<unsigned int>(aggregate);
    m_toc.header.headerSectionLength = static_cast<unsigned short>(computeTagLength());
}

void CRpfSource::writeFinish(FILE* fp) {
    nitf::CSerializerFileRaw out(fp, hostIsLittleEndian());
    out.seek(m_headerPosition);
    out << m_toc;
}

__int64 CRpfSource::computeTagLength() {
    return measure([&](CBinaryFields& f) { f(m_toc.header); });
}

__int64 CRpfSource::computeComponentsLength() {
    __int64 length = measure([&](CBinaryFields& f) { f(m_toc.location); });
    for (const nitf::CRpfComponentLocation& component : m_toc.location.components)
        length += measure([&](CBinaryFields& f) { m_toc.componentFields(f, component.id); });
    return length;
}

__int64 CRpfSource::computeTotalLength() {
    return computeTagLength() + computeComponentsLength();
}
