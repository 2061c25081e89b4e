// The RPFIMG TRE: the RPF location section of a frame file and the RPF sections that describe its image
// (coverage, compression, colour/grayscale, image description, display parameters, mask).
#pragma once

#include "NitfExtension.h"

class CRPFIMGExtension : public CNitfExtension {
public:
    // The field reader: the location section at the stream's position, its records taken from the header's
    // table offset.
    void readInfo(FILE* fp) override;
    const char* getName() const override { return "RPFIMG"; }

    // The RPF section reader: the location section at the TRE's start, then every section it lists that lies
    // wholly inside the TRE, each at its place. Records of the lookup and colormap subsections are counted by
    // their section subheaders (131, 134). The read length covers the location section and the sections read.
    // `flag` is not used.
    void readRpfSections(FILE* fp, bool flag);

private:
    // Reads `count` records of a subsection at the absolute position `at`; the read length stays that of the
    // subsection's header when there are none.
    void readRecords(FILE* fp, __int64 at, const CRecordLayout& records, __int64 count);
};
