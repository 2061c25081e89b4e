#include "RpfFrame.h"

#include <cstring>
#include <memory>

#include "HostError.h"
#include "NitfFileReader.h"
#include "NitfImageSource.h"
#include "NitfImageSourceVQ.h"
#include "NitfImageSubheader.h"
#include "NitfLutSource.h"
#include "NitfTag.h"
#include "RPFIMGExtension.h"
#include "Raise.h"
#include "RpfSource.h"

static const char kSourceFile[] = "nitf/lib/rpf/RpfFrame";

namespace {

// The coverage fields of the RPFIMG TRE, in the order of RpfCoverage_t.
const char* const kCoverageFields[] = {"UPPER_LEFT_LATITUDE",
                                       "UPPER_LEFT_LONGITUDE",
                                       "LOWER_LEFT_LATITUDE",
                                       "LOWER_LEFT_LONGITUDE",
                                       "UPPER_RIGHT_LATITUDE",
                                       "UPPER_RIGHT_LONGITUDE",
                                       "LOWER_RIGHT_LATITUDE",
                                       "LOWER_RIGHT_LONGITUDE",
                                       "NORTH_SOUTH_VERTICAL_RESOLUTION",
                                       "EAST_WEST_HORIZONTAL_RESOLUTION",
                                       "LATITUDE_VERTICAL_INTERVAL",
                                       "LONGITUDE_HORIZONTAL_INTERVAL"};

const int kCodes = 256; // pixels are one byte

} // namespace

CRpfFrame::CRpfFrame(CNitfFileReader& reader, int image)
    : m_hasCoverage(false), m_coverage(), m_transparentCode(-1), m_transparentCodeStored(false) {
    static const char signature[] = "__cdecl CRpfFrame::CRpfFrame(class CNitfFileReader &,int)";
    if (!reader.getFileHeader() || !reader.getInputStream())
        NITF_RAISE("The file is not open", signature);
    if (image < 0 || image >= reader.getImageCount())
        NITF_RAISE("Invalid image index", signature);
    readHeader(reader);
    std::unique_ptr<CNitfImageSubheader> subheader(
        reader.getFileHeader()->getNewImageSubheader(reader.getInputStream(), image));
    if (!subheader)
        NITF_RAISE("Invalid image index", signature);
    m_hasCoverage = readCoverage(reader.getInputStream(), *subheader, m_coverage);
    readColours(reader, *subheader);
    readTransparentCode(reader, image);
}

void CRpfFrame::readHeader(CNitfFileReader& reader) {
    CNitfTag* tag = CNitfTag::find("RPFHDR", reader.getFileHeader()->getTaggedRecords());
    if (!tag)
        NITF_RAISE("The file has no RPF header section (RPFHDR)",
                   "void __cdecl CRpfFrame::readHeader(class CNitfFileReader &)");
    CRpfSource::readHeaderSection(reader.getInputStream(), tag->getDataOffset(), m_header);
}

bool CRpfFrame::readCoverage(FILE* fp, CNitfImageSubheader& subheader, RpfCoverage_t& coverage) {
    std::unique_ptr<CRPFIMGExtension> sections(subheader.getRpfImgExtension());
    if (!sections)
        return false;
    sections->readNewInfo(fp, false);
    double values[std::size(kCoverageFields)];
    for (size_t i = 0; i < std::size(kCoverageFields); ++i) {
        CNitfProperty* field = FindProperty(sections->getProperties(), kCoverageFields[i]);
        if (!field)
            return false; // the TRE does not carry the coverage section
        const unsigned long long bits = CNitfExtension::getBinaryValue(field, 8);
        std::memcpy(&values[i], &bits, sizeof(double));
    }
    static_assert(sizeof(RpfCoverage_t) == sizeof values, "the coverage is its twelve values");
    std::memcpy(&coverage, values, sizeof values);
    return true;
}

void CRpfFrame::readColours(CNitfFileReader& reader, CNitfImageSubheader& subheader) {
    CNitfLutSource* lut = subheader.getLutSource(0);
    if (!lut || lut->getSize() <= 0)
        return;
    const int entries = lut->getEntryCount();
    const int components = lut->getEntrySize();
    std::vector<char> table(static_cast<size_t>(lut->getSize()));
    lut->readInterleaved(&reader, table.data(), lut->getSize());
    for (int e = 0; e < entries; ++e) {
        const unsigned char* entry =
            reinterpret_cast<const unsigned char*>(&table[static_cast<size_t>(e) * components]);
        const bool grey = components < 3;
        m_colours.push_back({entry[0], grey ? entry[0] : entry[1], grey ? entry[0] : entry[2], 255});
    }
}

void CRpfFrame::readTransparentCode(CNitfFileReader& reader, int image) {
    // The mask travels in the image data, where the image source reads it.
    try {
        std::unique_ptr<CNitfImageSource> source(reader.getNewImageSource(image));
        if (source->hasPadPixel() && source->getPadPixelValue() >= 0 && source->getPadPixelValue() < kCodes) {
            m_transparentCode = static_cast<int>(source->getPadPixelValue());
            const auto* vq = dynamic_cast<const CNitfImageSourceVQ*>(source.get());
            m_transparentCodeStored = !vq || !vq->isPadPixelFromColours();
        }
    } catch (const vexo::Exception& e) {
        vexo::nspio::Warning::Warn(e.what(), kSourceFile, __LINE__);
    }
    if (!m_transparentCodeStored && !m_colours.empty() && m_colours.size() < static_cast<size_t>(kCodes))
        m_transparentCode = static_cast<int>(m_colours.size());
    if (m_transparentCode >= 0 && static_cast<size_t>(m_transparentCode) < m_colours.size())
        m_colours[m_transparentCode].alpha = 0;
}

std::string CRpfFrame::getLocationCode() const {
    return m_hasCoverage ? CRpfSource::getGeographicLocation(m_coverage.lowerLeftLatitude,
                                                             m_coverage.lowerLeftLongitude)
                         : std::string();
}
