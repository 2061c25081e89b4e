// The layouts of the RPF sections that an RPFIMG TRE carries, prepared on first use. The records layouts
// repeat as many times as the caller says.
#pragma once

#include "RecordLayout.h"

namespace rpfsections {

const CRecordLayout& LocationHeader();
const CRecordLayout& LocationRecords();
const CRecordLayout& Coverage();
const CRecordLayout& Compression();
const CRecordLayout& LookupHeader();
const CRecordLayout& LookupRecords();
const CRecordLayout& ColorGrayscale();
const CRecordLayout& ColormapHeader();
const CRecordLayout& ColormapRecords();
const CRecordLayout& ImageDescription();
const CRecordLayout& ImageDisplay();
const CRecordLayout& Mask();

} // namespace rpfsections
