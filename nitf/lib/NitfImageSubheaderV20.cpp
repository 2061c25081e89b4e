#include "NitfImageSubheaderV20.h"

#include "ImageSubheaderLayouts.h"

void CNitfImageSubheaderV20::read(FILE* fp, eNitfVersion_t version) {
    readWith(fp, version);
}

void CNitfImageSubheaderV20::write(FILE* fp) {
    writeWithLayout(fp);
}

__int64 CNitfImageSubheaderV20::computeStorageLength() {
    return storageLength();
}

void CNitfImageSubheaderV20::getTitle(char* title) {
    buildTitle("ITITLE", title);
}

const CRecordLayout& CNitfImageSubheaderV20::readLayout(eNitfVersion_t) const {
    return imageSubheaderLayout20();
}

const CRecordLayout& CNitfImageSubheaderV20::writeLayout() const {
    return imageSubheaderLayout20();
}
