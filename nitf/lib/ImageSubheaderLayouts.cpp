#include "ImageSubheaderLayouts.h"

#include <cstring>

#include "NitfGeorefInfo.h"
#include "SecurityFields.h"

using namespace record;

// Whether the corners (IGEOLO) follow ICORDS: the georeferencing's own rule, so that the two never disagree.
template <eNitfVersion_t version> static bool hasCorners(const char* icords, size_t length) {
    CNitfGeorefInfo georef;
    georef.setCoordinateType(length > 0 ? icords[0] : '\0', version);
    return georef.hasCoordinates();
}

// NITF 2.0 carries COMRAT for every code but NC and NM.
static bool compressed20(const char* ic, size_t length) {
    return !(length == 2 && (std::memcmp(ic, "NC", 2) == 0 || std::memcmp(ic, "NM", 2) == 0));
}

// clang-format off
static const Entry kHead21[] = {
    Text("IM", 2), Text("IID1", 10), Text("IDATIM", 14),
};
static const Entry kTarget21[] = {
    Text("TGTID", 17), Text("IID2", 80),
};
static const Entry kOsde[] = {
    Text("IINFO", 97), Text("ISCSEC", 167),
};
static const Entry kHead20[] = {
    Text("IM", 2), Text("IID", 10), Text("IDATIM", 14), Text("TGTID", 17), Text("ITITLE", 80),
};

// From ENCRYP to ICORDS.
static const Entry kImage[] = {
    Text("ENCRYP", 1), Text("ISORCE", 42), Text("NROWS", 8), Text("NCOLS", 8), Text("PVTYPE", 3),
    Text("IREP", 8), Text("ICAT", 8), Text("ABPP", 2), Text("PJUST", 1), Text("ICORDS", 1),
};
// The corners follow when ICORDS gives them (the test opens the group that kCorners closes).
static const Entry kIfCorners21[] = {IfCall("ICORDS", hasCorners<eNitfVersion21>)};
static const Entry kIfCorners20[] = {IfCall("ICORDS", hasCorners<eNitfVersion20>)};
static const Entry kCorners[] = {
        // Written only when given: the georeferencing puts the corners there.
        Text("IGEOLO1", 15, kHole), Text("IGEOLO2", 15, kHole), Text("IGEOLO3", 15, kHole),
        Text("IGEOLO4", 15, kHole),
    End(),
    Text("NICOM", 1),
    Repeat("NICOM"),
        Place("ICOM", 80), // read on demand
    End(),
    Text("IC", 2),
};
// The list is closed on purpose: other codes (C0, C2, C6, C7, M0, ...) carry no COMRAT.
static const Entry kRateAndBandCount21[] = {
    IfTextIn("IC", "C1|C3|C4|C5|C8|I1|M1|M3|M4|M5|M8"),
        Text("COMRAT", 4),
    End(),
    Text("NBANDS", 1),
    IfText("NBANDS", "0"),
        Text("XBANDS", 5),
    End(),
    RepeatBands("NBANDS", "XBANDS"), // closed in kBands
};
static const Entry kRateAndBandCount20[] = {
    IfCall("IC", compressed20),
        Text("COMRAT", 4),
    End(),
    Text("NBANDS", 1),
    RepeatBands("NBANDS", nullptr), // closed in kBands
};
static const Entry kBands[] = {
        Text("IREPBAND", 2), Text("ISUBCAT", 6), Text("IFC", 1), Text("IMFLT", 3), Text("NLUTS", 1),
        IfNotZero("NLUTS"),
            Text("NELUT", 5),
            PlaceSizedByProduct("LUTD", "NLUTS", "NELUT"), // read through the look-up table sources
        End(),
    End(),
    Text("ISYNC", 1), Text("IMODE", 1), Text("NBPR", 4), Text("NBPC", 4), Text("NPPBH", 4), Text("NPPBV", 4),
    Text("NBPP", 2), Text("IDLVL", 3), Text("IALVL", 3), Text("ILOC", 10), Text("IMAG", 4),
};
// The TREs: user-defined, then extended sub-header data.
static const Entry kTagAreas[] = {
    Text("UDIDL", 5),
    IfNotZero("UDIDL"),
        Place("UDOFL", 3),
        TagArea("UDID", "UDIDL"),
    End(),
    Text("IXSHDL", 5),
    IfNotZero("IXSHDL"),
        Place("IXSOFL", 3),
        TagArea("IXSHD", "IXSHDL"),
    End(),
};
// clang-format on

const CRecordLayout& imageSubheaderLayout21(eNitfVersion_t version) {
    static const CRecordLayout nitf({kHead21, kTarget21, Part(securityFields21("IS")), kImage, kIfCorners21,
                                     kCorners, kRateAndBandCount21, kBands, kTagAreas});
    static const CRecordLayout osde(
        {kHead21, kOsde, kImage, kIfCorners21, kCorners, kRateAndBandCount21, kBands, kTagAreas});
    static const CRecordLayout other(
        {kHead21, kImage, kIfCorners21, kCorners, kRateAndBandCount21, kBands, kTagAreas});
    if (version == eOsdeVersion01)
        return osde;
    if (version == eNitfVersion21 || version == eNitfVersion21Variant || version == eNsifVersion10)
        return nitf;
    return other;
}

const CRecordLayout& imageSubheaderLayout20() {
    static const CRecordLayout layout({kHead20, Part(securityFields20("IS")), kImage, kIfCorners20, kCorners,
                                       kRateAndBandCount20, kBands, kTagAreas});
    return layout;
}

const CRecordLayout& imageSubheaderLayout10() {
    static const CRecordLayout layout({kHead20, Part(securityFields20("IS", nullptr, true)), kImage,
                                       kIfCorners20, kCorners, kRateAndBandCount20, kBands});
    return layout;
}
