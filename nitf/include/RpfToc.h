// The RPF table of contents of an A.TOC file: the header section, the location section, and the four
// components it locates (the boundary rectangle section subheader and table, the frame file index section
// subheader and the frame file index with its pathname records). Serialized as a whole: the header at the
// serializer's position, the location section at the header's location section location, each component at
// its recorded location. Components a file does not list are left empty.
#pragma once

#include <vector>

#include "RpfBoundaryRectangleSection.h"
#include "RpfFrameFileIndexSection.h"
#include "RpfHeaderSection.h"
#include "RpfLocationSection.h"
#include "RpfPathnameRecord.h"

namespace nitf {

class CRpfToc : public CSerializableRecord {
public:
    static constexpr const char* kName = "RPF table of contents";
    // Identifiers of the components of an A.TOC.
    static const unsigned short kBoundaryRectangleSection = 148;
    static const unsigned short kBoundaryRectangleTable = 149;
    static const unsigned short kFrameFileIndexSection = 150;
    static const unsigned short kFrameFileIndex = 151;

    CRpfHeaderSection header;
    CRpfLocationSection location;
    CRpfBoundaryRectangleSection rectangleSection;
    std::vector<CRpfBoundaryRectangleRecord> rectangles;
    CRpfFrameFileIndexSection frameIndexSection;
    std::vector<CRpfFrameFileIndexRecord> frames;
    std::vector<CRpfPathnameRecord> pathnames;

    void fields(CBinaryFields& f) override;
    const char* recordName() const override { return kName; }
    // The location section and the components, from the position on.
    void bodyFields(CBinaryFields& f);
    // The fields of component `id` (148 to 151) at the position; nothing for other identifiers.
    void componentFields(CBinaryFields& f, unsigned short id);

    // The offset of each pathname record from the start of the frame file index (they follow the frame
    // records).
    std::vector<unsigned int> pathnameOffsets() const;
    // Each frame record gets the pathname record at its offset (-1 when none starts there).
    void resolvePathnames();
    // Each frame record's offset from its pathname record.
    void assignPathnameOffsets();
    // Raises vexo::Exception for a frame record whose boundary rectangle does not exist or whose row or
    // column lies outside that rectangle's frame grid.
    void checkFrames() const;
};

} // namespace nitf
