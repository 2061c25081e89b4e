#include "NitfGeorefInfo.h"

void CNitfGeorefInfo::setCoordinateType(char icords, eNitfVersion_t version) {
    bool family21 = isNitf21Family(version);
    if ((family21 && icords == ' ') || (!family21 && icords == 'N') || icords == '\0') {
        m_type = eCoordinatesNone;
        return;
    }
    switch (icords) {
    case 'G':
        m_type = eCoordinatesGeographic;
        break;
    case 'D':
        m_type = eCoordinatesDecimal;
        break;
    case 'N':
        m_type = eCoordinatesUtmNorth;
        break;
    case 'S':
        m_type = eCoordinatesUtmSouth;
        break;
    case 'U':
        m_type = eCoordinatesMgrs;
        break;
    case 'P':
        m_type = eCoordinatesUps;
        break;
    case 'C':
        m_type = eCoordinatesGeocentric;
        break;
    default:
        m_type = eCoordinatesOther;
        break;
    }
}
