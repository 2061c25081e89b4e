#include "TreRegistry.h"

#include "ACFTBExtension.h"
#include "AIMIDBExtension.h"
#include "BANDSBExtension.h"
#include "CSCCGAExtension.h"
#include "CSCRNAExtension.h"
#include "CSDIDAExtension.h"
#include "CSEXRAExtension.h"
#include "CSPROAExtension.h"
#include "CSSFAAExtension.h"
#include "ENGRDAExtension.h"
#include "ESD001Extension.h"
#include "GEOPSBExtension.h"
#include "HISTOAExtension.h"
#include "ICHIPBExtension.h"
#include "IMUDTGExtension.h"
#include "IMXDTGExtension.h"
#include "IOMAPAExtension.h"
#include "J2KLRAExtension.h"
#include "JITCIDExtension.h"
#include "MAPLOBExtension.h"
#include "MHUDTGExtension.h"
#include "MHXDTGExtension.h"
#include "MSTGTAExtension.h"
#include "NBLOCAExtension.h"
#include "PIAEQAExtension.h"
#include "PIAEVAExtension.h"
#include "PIAIMBExtension.h"
#include "PIAIMCExtension.h"
#include "PIAPEAExtension.h"
#include "PIAPEBExtension.h"
#include "PIAPRCExtension.h"
#include "PIAPRDExtension.h"
#include "PIATGAExtension.h"
#include "PIATGBExtension.h"
#include "PRJPSBExtension.h"
#include "RPFHDRExtension.h"
#include "RPFIMGExtension.h"
#include "STDIDCExtension.h"
#include "STREOBExtension.h"
#include "TESTINExtension.h"
#include "USE00AExtension.h"

template <typename Extension> static CNitfExtension* make() {
    return new Extension;
}

template <typename Extension> static TreRegistration registration(const char* name) {
    return {name, make<Extension>};
}

const std::vector<TreRegistration>& treRegistry() {
    static const std::vector<TreRegistration> registry = {
        registration<CSTDIDCExtension>("STDIDC"),
        registration<CAIMIDBExtension>("AIMIDB"),
        registration<CACFTBExtension>("ACFTB"),
        registration<CUSE00AExtension>("USE00A"),
        registration<CSTREOBExtension>("STREOB"),
        registration<CPIAIMBExtension>("PIAIMB"),
        registration<CPIAIMCExtension>("PIAIMC"),
        registration<CPIAPRCExtension>("PIAPRC"),
        registration<CPIAPRDExtension>("PIAPRD"),
        registration<CPIAPEAExtension>("PIAPEA"),
        registration<CPIAPEBExtension>("PIAPEB"),
        registration<CIOMAPAExtension>("IOMAPA"),
        registration<CMSTGTAExtension>("MSTGTA"),
        registration<CRPFHDRExtension>("RPFHDR"),
        registration<CRPFIMGExtension>("RPFIMG"),
        registration<CESD001Extension>("ESD001"),
        registration<CJ2KLRAExtension>("J2KLRA"),
        registration<CHISTOAExtension>("HISTOA"),
        registration<CPIATGAExtension>("PIATGA"),
        registration<CPIATGBExtension>("PIATGB"),
        registration<CPIAEQAExtension>("PIAEQA"),
        registration<CPIAEVAExtension>("PIAEVA"),
        registration<CGEOPSBExtension>("GEOPSB"),
        registration<CMHUDTGExtension>("MHUDTG"),
        registration<CMHXDTGExtension>("MHXDTG"),
        registration<CIMUDTGExtension>("IMUDTG"),
        registration<CIMXDTGExtension>("IMXDTG"),
        registration<CJITCIDExtension>("JITCID"),
        registration<CTESTINExtension>("TESTIN"),
        registration<CENGRDAExtension>("ENGRDA"),
        registration<CBANDSBExtension>("BANDSB"),
        registration<CNBLOCAExtension>("NBLOCA"),
        registration<CICHIPBExtension>("ICHIPB"),
        registration<CCSCRNAExtension>("CSCRNA"),
        registration<CCSDIDAExtension>("CSDIDA"),
        registration<CCSEXRAExtension>("CSEXRA"),
        registration<CCSSFAAExtension>("CSSFAA"),
        registration<CPRJPSBExtension>("PRJPSB"),
        registration<CCSPROAExtension>("CSPROA"),
        registration<CMAPLOBExtension>("MAPLOB"),
        registration<CCSCCGAExtension>("CSCCGA"),
        // Rational polynomial coefficients: known, and read by CRpcSource rather than built here.
        {"RPC00B", nullptr},
        {"RPC00A", nullptr},
    };
    return registry;
}
