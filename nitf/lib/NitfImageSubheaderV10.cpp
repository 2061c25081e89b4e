#include "NitfImageSubheaderV10.h"

#include "ImageSubheaderLayouts.h"

const CRecordLayout& CNitfImageSubheaderV10::readLayout(eNitfVersion_t) const {
    return imageSubheaderLayout10();
}
