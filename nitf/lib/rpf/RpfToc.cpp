#include "RpfToc.h"

#include <unordered_map>

#include "Raise.h"

static const char kSourceFile[] = "nitf/lib/rpf/RpfToc";

namespace nitf {

void CRpfToc::fields(CBinaryFields& f) {
    f(header);
    f.seek(header.locationSectionLocation);
    bodyFields(f);
}

void CRpfToc::bodyFields(CBinaryFields& f) {
    f(location);
    // Components are looked up by identifier: files list them in any order, and place them anywhere.
    for (unsigned short id = kBoundaryRectangleSection; id <= kFrameFileIndex; ++id) {
        if (const CRpfComponentLocation* component = location.find(id)) {
            f.seek(component->location);
            componentFields(f, id);
        }
    }
}

void CRpfToc::componentFields(CBinaryFields& f, unsigned short id) {
    switch (id) {
    case kBoundaryRectangleSection:
        f(rectangleSection);
        break;
    case kBoundaryRectangleTable:
        f.table(rectangles, rectangleSection.recordCount, f.position(), rectangleSection.recordLength);
        break;
    case kFrameFileIndexSection:
        f(frameIndexSection);
        break;
    case kFrameFileIndex: {
        const __int64 start = f.position();
        f.table(frames, frameIndexSection.recordCount, start, frameIndexSection.recordLength);
        f.seek(start + static_cast<__int64>(frames.size()) * frameIndexSection.recordLength);
        f.run(pathnames, frameIndexSection.pathnameCount, CRpfPathnameRecord::kShortest);
        break;
    }
    default:
        break;
    }
}

std::vector<unsigned int> CRpfToc::pathnameOffsets() const {
    std::vector<unsigned int> offsets;
    unsigned long long offset =
        static_cast<unsigned long long>(frames.size()) * frameIndexSection.recordLength;
    for (const CRpfPathnameRecord& pathname : pathnames) {
        offsets.push_back(static_cast<unsigned int>(offset));
        offset += 2 + pathname.text.size();
    }
    return offsets;
}

void CRpfToc::resolvePathnames() {
    const std::vector<unsigned int> offsets = pathnameOffsets();
    std::unordered_map<unsigned int, int> byOffset;
    for (size_t i = 0; i < offsets.size(); ++i)
        byOffset.emplace(offsets[i], static_cast<int>(i));
    for (CRpfFrameFileIndexRecord& frame : frames) {
        auto found = byOffset.find(frame.pathnameOffset);
        frame.pathname = found == byOffset.end() ? -1 : found->second;
    }
}

void CRpfToc::assignPathnameOffsets() {
    const std::vector<unsigned int> offsets = pathnameOffsets();
    for (CRpfFrameFileIndexRecord& frame : frames)
        if (frame.pathname >= 0 && static_cast<size_t>(frame.pathname) < offsets.size())
            frame.pathnameOffset = offsets[frame.pathname];
}

void CRpfToc::checkFrames() const {
    static const char signature[] = "void __cdecl nitf::CRpfToc::checkFrames(void)";
    for (size_t i = 0; i < frames.size(); ++i) {
        const CRpfFrameFileIndexRecord& frame = frames[i];
        const std::string name = textOf(frame.fileName);
        if (frame.boundaryRectangle >= rectangles.size())
            NITF_RAISE_FORMAT(signature,
                              "RPF frame file index record %zu (%s) refers to boundary rectangle %u of %zu",
                              i, name.c_str(), frame.boundaryRectangle, rectangles.size());
        const CRpfBoundaryRectangleRecord& rectangle = rectangles[frame.boundaryRectangle];
        if (frame.row >= rectangle.verticalFrames || frame.column >= rectangle.horizontalFrames)
            NITF_RAISE_FORMAT(
                signature,
                "RPF frame file index record %zu (%s) lies at row %u, column %u, outside the %u x "
                "%u frames of boundary rectangle %u",
                i, name.c_str(), frame.row, frame.column, rectangle.verticalFrames,
                rectangle.horizontalFrames, frame.boundaryRectangle);
    }
}

} // namespace nitf
