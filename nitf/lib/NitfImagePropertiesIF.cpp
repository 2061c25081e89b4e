#include "NitfImagePropertiesIF.h"

#include <cmath>
#include <cstring>

CNitfImagePropertiesIF::CNitfImagePropertiesIF()
    : m_compressionType(eCompressionNone), m_interleavingType(eInterleavingUnknown), m_imageWidth(0),
      m_imageHeight(0), m_actualWidth(0), m_actualHeight(0), m_bandCount(0), m_bpp(0), m_actualBpp(0),
      m_tileWidth(0), m_tileHeight(0), m_tileCountX(0), m_tileCountY(0), m_dataValid(true) {}

// The integer of a field; an absent field reads as 0 and is inserted empty, as lookups by name always did.
static int fieldValue(PropertyMap& map, const char* name) {
    CNitfProperty*& value = map[const_cast<char*>(name)];
    if (!value)
        value = new CNitfProperty("");
    return value->getDataType() == CNitfProperty::eNone ? 0 : value->getAsInt();
}

void CNitfImagePropertiesIF::setProperties(PropertyMap& map) {
    m_dataValid = true;
    m_actualWidth = fieldValue(map, "NCOLS");
    if (m_actualWidth == 0)
        m_dataValid = false;
    m_actualHeight = fieldValue(map, "NROWS");
    if (m_actualHeight == 0)
        m_dataValid = false;
    m_bandCount = fieldValue(map, "NBANDS");
    if (m_bandCount == 0)
        m_bandCount = fieldValue(map, "XBANDS");
    if (m_bandCount == 0)
        m_dataValid = false;

    m_bpp = fieldValue(map, "NBPP");
    m_actualBpp = fieldValue(map, "ABPP");
    static const int validDepths[] = {1, 4, 8, 11, 12, 16, 32, 64};
    bool known = false;
    for (int depth : validDepths)
        known = known || m_bpp == depth;
    if (!known || m_actualBpp > m_bpp)
        m_dataValid = false;

    m_tileCountX = fieldValue(map, "NBPR");
    if (m_tileCountX == 0)
        m_dataValid = false;
    m_tileCountY = fieldValue(map, "NBPC");
    if (m_tileCountY == 0)
        m_dataValid = false;

    m_tileWidth = fieldValue(map, "NPPBH");
    if (m_tileWidth == 0)
        m_tileWidth = m_actualWidth;
    if (m_tileWidth == 0)
        m_dataValid = false;
    m_tileHeight = fieldValue(map, "NPPBV");
    if (m_tileHeight == 0)
        m_tileHeight = m_actualHeight;
    if (m_tileHeight == 0)
        m_dataValid = false;

    // Products that overflow an int are damage; they are kept at 0 rather than wrapped.
    long long height = static_cast<long long>(m_tileHeight) * m_tileCountY;
    long long width = static_cast<long long>(m_tileCountX) * m_tileWidth;
    m_imageHeight = height > 0x7FFFFFFF || height < 0 ? 0 : static_cast<int>(height);
    m_imageWidth = width > 0x7FFFFFFF || width < 0 ? 0 : static_cast<int>(width);

    CNitfProperty* mode = FindProperty(map, "IMODE");
    const char* text = mode && mode->getDataType() == CNitfProperty::eString ? mode->getAsString() : "";
    m_interleavingType = eInterleavingUnknown;
    if (std::strlen(text) == 1) {
        switch (text[0]) {
        case 'S':
            m_interleavingType = eBandSequential;
            break;
        case 'B':
            m_interleavingType = eBandInterleavedByBlock;
            break;
        case 'P':
            m_interleavingType = eBandInterleavedByPixel;
            break;
        case 'R':
            m_interleavingType = eBandInterleavedByRow;
            break;
        default:
            break;
        }
    }
}

int CNitfImagePropertiesIF::getImageBandWidthBufferSize() const {
    return static_cast<int>((static_cast<long long>(m_bpp) * m_imageWidth) >> 3);
}

int CNitfImagePropertiesIF::getImageWidthBufferSize() const {
    return getImageBandWidthBufferSize() * m_bandCount;
}

__int64 CNitfImagePropertiesIF::getImageBandBufferSize() const {
    return static_cast<__int64>(std::ceil(static_cast<double>(m_imageHeight) * m_imageWidth * m_bpp * 0.125));
}

__int64 CNitfImagePropertiesIF::getImageBufferSize() const {
    return m_bandCount * getImageBandBufferSize();
}

bool CNitfImagePropertiesIF::deliversWholeSamples() const {
    switch (m_compressionType) {
    case eCompressionNone:
    case eCompressionUncompressed:
    case eCompressionBilevel:
        return false;
    default:
        return true;
    }
}

int CNitfImagePropertiesIF::getSampleContainerBytes() const {
    if (m_bpp <= 8)
        return 1;
    if (m_bpp <= 16)
        return 2;
    return m_bpp <= 32 ? 4 : 8;
}

int CNitfImagePropertiesIF::getTileBandWidthBufferSize() const {
    // 12-bit JPEG samples (and every other depth that is not a whole container, in the sources that decode
    // into whole samples) are delivered in the container, two bytes for 12 bits.
    if (deliversWholeSamples() && m_bpp % 8 != 0 && m_bpp > 0 && m_bpp <= 64)
        return static_cast<int>(static_cast<long long>(m_tileWidth) * getSampleContainerBytes());
    return static_cast<int>(static_cast<long long>(m_tileWidth) * m_bpp / 8);
}

int CNitfImagePropertiesIF::getTileWidthBufferSize() const {
    return m_bandCount * getTileBandWidthBufferSize();
}

__int64 CNitfImagePropertiesIF::getTileBandBufferSize() const {
    return static_cast<__int64>(std::ceil(static_cast<double>(m_tileHeight) * m_tileWidth * m_bpp * 0.125));
}

__int64 CNitfImagePropertiesIF::getTileBufferSize() const {
    return m_bandCount * getTileBandBufferSize();
}

__int64 CNitfImagePropertiesIF::getTileBandReadBufferSize() const {
    const __int64 rows = static_cast<__int64>(m_tileHeight) * getTileBandWidthBufferSize();
    const __int64 stored = getTileBandBufferSize();
    return rows > stored ? rows : stored;
}

__int64 CNitfImagePropertiesIF::getTileReadBufferSize() const {
    const __int64 rows = static_cast<__int64>(m_tileHeight) * getTileWidthBufferSize();
    const __int64 stored = getTileBufferSize();
    return rows > stored ? rows : stored;
}

// Replaces an existing field's value with an integer; an absent field stays absent.
static void replaceField(PropertyMap& map, const char* name, int value) {
    auto found = map.find(const_cast<char*>(name));
    if (found == map.end())
        return;
    delete found->second;
    found->second = new CNitfProperty(value);
}

void CNitfImagePropertiesIF::setActualBpp(PropertyMap& map, int value) {
    replaceField(map, "ABPP", value);
    m_actualBpp = value;
}
void CNitfImagePropertiesIF::setBandCount(PropertyMap& map, int value) {
    replaceField(map, "NBANDS", value);
    replaceField(map, "XBANDS", value);
    m_bandCount = value;
}
void CNitfImagePropertiesIF::setBpp(PropertyMap& map, int value) {
    replaceField(map, "NBPP", value);
    m_bpp = value;
}
void CNitfImagePropertiesIF::setImageActualHeight(PropertyMap& map, int value) {
    replaceField(map, "NROWS", value);
    m_actualHeight = value;
}
void CNitfImagePropertiesIF::setImageActualWidth(PropertyMap& map, int value) {
    replaceField(map, "NCOLS", value);
    m_actualWidth = value;
}
void CNitfImagePropertiesIF::setTileCountX(PropertyMap& map, int value) {
    replaceField(map, "NBPR", value);
    m_tileCountX = value;
}
void CNitfImagePropertiesIF::setTileCountY(PropertyMap& map, int value) {
    replaceField(map, "NBPC", value);
    m_tileCountY = value;
}
void CNitfImagePropertiesIF::setTileHeight(PropertyMap& map, int value) {
    replaceField(map, "NPPBV", value);
    m_tileHeight = value;
}
void CNitfImagePropertiesIF::setTileWidth(PropertyMap& map, int value) {
    replaceField(map, "NPPBH", value);
    m_tileWidth = value;
}

const char* CNitfImagePropertiesIF::getPVType(int type) {
    switch (type) {
    case ePVTypeInteger:
        return "INT (Integer)";
    case ePVTypeBilevel:
        return "B (Bi-level)";
    case ePVTypeSignedInteger:
        return "SI (Signed Integer)";
    case ePVTypeReal:
        return "R (Real)";
    case ePVTypeComplex:
        return "C (Complex)";
    default:
        return "Unknown";
    }
}
