// The layout of every TRE the library parses, prepared on first use (see TreLayout.h).
#pragma once

#include "TreLayout.h"

namespace tre {
namespace layouts {

const Layout& ACFTB();
const Layout& AIMIDB();
const Layout& BANDSB();
const Layout& CSCCGA();
const Layout& CSCRNA();
const Layout& CSDIDA();
const Layout& CSEXRA();
const Layout& CSPROA();
const Layout& CSSFAA();
const Layout& ENGRDA();
const Layout& ESD001();
const Layout& GEOPSB();
const Layout& HISTOA();
const Layout& ICHIPB();
const Layout& IMUDTG();
const Layout& IMXDTG();
const Layout& IOMAPA();
const Layout& J2KLRA();
const Layout& JITCID();
const Layout& MAPLOB();
const Layout& MHUDTG();
const Layout& MHXDTG();
const Layout& MSTGTA();
const Layout& NBLOCA();
const Layout& PIAEQA();
const Layout& PIAEVA();
const Layout& PIAIMB();
const Layout& PIAIMC();
const Layout& PIAPEA();
const Layout& PIAPEB();
const Layout& PIAPR(); // PIAPRC and PIAPRD
const Layout& PIATGA();
const Layout& PIATGB();
const Layout& PRJPSB();
const Layout& RPFHDR();
const Layout& STDIDC();
const Layout& STREOB();
const Layout& TESTIN();
const Layout& USE00A();

// RPFIMG: the location section (its header, then its records at the header's table offset) and the RPF
// sections found inside the TRE. The records layouts repeat as many times as the caller says.
const Layout& RpfLocationHeader();
const Layout& RpfLocationRecords();
const Layout& RpfCoverage();
const Layout& RpfCompression();
const Layout& RpfLookupHeader();
const Layout& RpfLookupRecords();
const Layout& RpfColorGrayscale();
const Layout& RpfColormapHeader();
const Layout& RpfColormapRecords();
const Layout& RpfImageDescription();
const Layout& RpfImageDisplay();
const Layout& RpfMask();

} // namespace layouts
} // namespace tre
