// The RPF sections that an RPFIMG TRE carries (binary fields big-endian), in file order.
#include "RpfSections.h"

namespace rpfsections {

using namespace record;

// clang-format off
static const Entry kLocationHeader[] = {
    Unsigned("LOCATION_SECTION_LENGTH", 2),
    Unsigned("COMPONENT_LOCATION_TABLE_OFFSET", 4),
    Unsigned("NUMBER_OF_COMPONENT_LOCATION_RECORDS", 2),
    Unsigned("COMPONENT_LOCATION_RECORD_LENGTH", 2),
    Unsigned("COMPONENT_AGGREGATE_LENGTH", 4),
};
// As many as the header counts, at its table offset.
static const Entry kLocationRecords[] = {
    RepeatExternal(),
        Unsigned("COMPONENT_ID", 2),
        Unsigned("COMPONENT_LENGTH", 4),
        Unsigned("COMPONENT_LOCATION", 4),
    End(),
};
// 130: coverage section, float64 values.
static const Entry kCoverage[] = {
    Double("UPPER_LEFT_LATITUDE"),
    Double("UPPER_LEFT_LONGITUDE"),
    Double("LOWER_LEFT_LATITUDE"),
    Double("LOWER_LEFT_LONGITUDE"),
    Double("UPPER_RIGHT_LATITUDE"),
    Double("UPPER_RIGHT_LONGITUDE"),
    Double("LOWER_RIGHT_LATITUDE"),
    Double("LOWER_RIGHT_LONGITUDE"),
    Double("NORTH_SOUTH_VERTICAL_RESOLUTION"),
    Double("EAST_WEST_HORIZONTAL_RESOLUTION"),
    Double("LATITUDE_VERTICAL_INTERVAL"),
    Double("LONGITUDE_HORIZONTAL_INTERVAL"),
};
// 131: compression section subheader.
static const Entry kCompression[] = {
    Unsigned("COMPRESSION_ALGORITHM_ID", 2),
    Unsigned("NUMBER_OF_COMPRESSION_LOOKUP_OFFSET_RECORDS", 2),
    Unsigned("NUMBER_OF_COMPRESSION_PARAMETER_OFFSET_RECORDS", 2),
};
// 132: compression lookup subsection header, then its offset records (as many as 131 counts).
static const Entry kLookupHeader[] = {
    Unsigned("COMPRESSION_LOOKUP_OFFSET_TABLE_OFFSET", 4),
    Unsigned("COMPRESSION_LOOKUP_TABLE_OFFSET_RECORD_LENGTH", 2),
};
static const Entry kLookupRecords[] = {
    RepeatExternal(),
        Unsigned("COMPRESSION_LOOKUP_TABLE_ID", 2),
        Unsigned("NUMBER_OF_COMPRESSION_LOOKUP_RECORDS", 4),
        Unsigned("NUMBER_OF_VALUES_PER_COMPRESSION_LOOKUP_RECORD", 2),
        Unsigned("COMPRESSION_LOOKUP_VALUE_BIT_LENGTH", 2),
        Unsigned("COMPRESSION_LOOKUP_TABLE_OFFSET", 4),
    End(),
};
// 134: colour/grayscale section subheader.
static const Entry kColorGrayscale[] = {
    Unsigned("NUMBER_OF_COLOR_GRAYSCALE_OFFSET_RECORDS", 1),
    Unsigned("NUMBER_OF_COLOR_CONVERTER_OFFSET_RECORDS", 1),
    Text("EXTERNAL_COLOR_GRAYSCALE_FILENAME", 12),
};
// 135: colormap subsection header, then its offset records (as many as 134 counts).
static const Entry kColormapHeader[] = {
    Unsigned("COLORMAP_OFFSET_TABLE_OFFSET", 4),
    Unsigned("COLOR_GRAYSCALE_OFFSET_RECORD_LENGTH", 2),
};
static const Entry kColormapRecords[] = {
    RepeatExternal(),
        Unsigned("COLOR_GRAYSCALE_TABLE_ID", 2),
        Unsigned("NUMBER_OF_COLOR_GRAYSCALE_RECORDS", 4),
        Unsigned("COLOR_GRAYSCALE_ELEMENT_LENGTH", 1),
        Unsigned("HISTOGRAM_RECORD_LENGTH", 2),
        Unsigned("COLOR_GRAYSCALE_TABLE_OFFSET", 4),
        Unsigned("HISTOGRAM_TABLE_OFFSET", 4),
    End(),
};
// 136: image description subheader.
static const Entry kImageDescription[] = {
    Unsigned("NUMBER_OF_SPECTRAL_GROUPS", 2),
    Unsigned("NUMBER_OF_SUBFRAME_TABLES", 2),
    Unsigned("NUMBER_OF_SPECTRAL_BAND_TABLES", 2),
    Unsigned("NUMBER_OF_SPECTRAL_BAND_LINES_PER_IMAGE_ROW", 2),
    Unsigned("NUMBER_OF_SUBFRAMES_EAST_WEST", 2),
    Unsigned("NUMBER_OF_SUBFRAMES_NORTH_SOUTH", 2),
    Unsigned("NUMBER_OF_OUTPUT_COLUMNS_PER_SUBFRAME", 4),
    Unsigned("NUMBER_OF_OUTPUT_ROWS_PER_SUBFRAME", 4),
    Unsigned("SUBFRAME_MASK_TABLE_OFFSET", 4),
    Unsigned("TRANSPARENCY_MASK_TABLE_OFFSET", 4),
};
// 137: image display parameters subheader.
static const Entry kImageDisplay[] = {
    Unsigned("NUMBER_OF_IMAGE_ROWS", 4),
    Unsigned("NUMBER_OF_IMAGE_CODES_PER_ROW", 4),
    Unsigned("IMAGE_CODE_BIT_LENGTH", 1),
};
// 138: mask subsection header; the transparent pixel code takes the bytes its bit length needs.
static const Entry kMask[] = {
    Unsigned("SUBFRAME_SEQUENCE_RECORD_LENGTH", 2),
    Unsigned("TRANSPARENCY_SEQUENCE_RECORD_LENGTH", 2),
    Unsigned("TRANSPARENT_OUTPUT_PIXEL_CODE_LENGTH", 2),
    BytesSizedByBits("TRANSPARENT_OUTPUT_PIXEL_CODE", "TRANSPARENT_OUTPUT_PIXEL_CODE_LENGTH"),
};
// clang-format on

const CRecordLayout& LocationHeader() {
    static const CRecordLayout layout(kLocationHeader);
    return layout;
}
const CRecordLayout& LocationRecords() {
    static const CRecordLayout layout(kLocationRecords);
    return layout;
}
const CRecordLayout& Coverage() {
    static const CRecordLayout layout(kCoverage);
    return layout;
}
const CRecordLayout& Compression() {
    static const CRecordLayout layout(kCompression);
    return layout;
}
const CRecordLayout& LookupHeader() {
    static const CRecordLayout layout(kLookupHeader);
    return layout;
}
const CRecordLayout& LookupRecords() {
    static const CRecordLayout layout(kLookupRecords);
    return layout;
}
const CRecordLayout& ColorGrayscale() {
    static const CRecordLayout layout(kColorGrayscale);
    return layout;
}
const CRecordLayout& ColormapHeader() {
    static const CRecordLayout layout(kColormapHeader);
    return layout;
}
const CRecordLayout& ColormapRecords() {
    static const CRecordLayout layout(kColormapRecords);
    return layout;
}
const CRecordLayout& ImageDescription() {
    static const CRecordLayout layout(kImageDescription);
    return layout;
}
const CRecordLayout& ImageDisplay() {
    static const CRecordLayout layout(kImageDisplay);
    return layout;
}
const CRecordLayout& Mask() {
    static const CRecordLayout layout(kMask);
    return layout;
}

} // namespace rpfsections
