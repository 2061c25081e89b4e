#include "NitfExtension.h"

#include <cstring>

#include "HostCompat.h"

// The identifiers the library understands, by parser or (RPC00A/B) by the rational polynomial source.
static const char* const kKnownExtensions[] = {
    "ACFTB",  "AIMIDB", "BANDSB", "CSCCGA",  "CSCRNA", "CSDIDA", "CSEXRA", "CSPROA", "CSSFAA",
    "ENGRDA", "ESD001", "GEOPSB", "HISTOA",  "MHUDTG", "MHXDTG", "IMUDTG", "IMXDTG", "ICHIPB",
    "IOMAPA", "J2KLRA", "JITCID", "MAPLOB",  "MSTGTA", "NBLOCA", "PIAEQA", "PIAEVA", "PIAIMB",
    "PIAIMC", "PIAPEA", "PIAPEB", "PIATGA",  "PIATGB", "PIAPRC", "PIAPRD", "PRJPSB", "RPFHDR",
    "RPFIMG", "STDIDC", "STREOB", "TESTING", "USE00A", "RPC00B", "RPC00A",
};

bool CNitfExtension::isKnownExtension(const char* identifier) {
    // Identifiers of four or five significant characters stand blank-padded in the file.
    size_t compared = 6;
    if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] == ' ')
        compared = 4;
    else if (identifier[0] && identifier[1] && identifier[2] && identifier[3] && identifier[4] &&
             identifier[5] == ' ')
        compared = 5;
    for (const char* name : kKnownExtensions) {
        if (_strnicmp(identifier, name, compared) == 0)
            return true;
    }
    return false;
}
