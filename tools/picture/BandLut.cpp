#include "BandLut.h"

#include "NitfFile.h"
#include "NitfImageSource.h"
#include "NitfLutSource.h"

namespace nitfpicture {

BandLut readBandLut(CNitfFile& file, CNitfImageSource& source, int band) {
    BandLut table;
    for (int i = 0; i < source.getLutCount(); ++i) {
        CNitfLutSource* lut = source.getLutSource(i);
        if (!lut || lut->getBand() != band + 1 || lut->getSize() <= 0)
            continue;
        table.components = lut->getEntrySize();
        table.entries.assign(static_cast<size_t>(lut->getSize()), 0);
        lut->readInterleaved(&file, reinterpret_cast<char*>(table.entries.data()), lut->getSize());
        break;
    }
    return table;
}

} // namespace nitfpicture
