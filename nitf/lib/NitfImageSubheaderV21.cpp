#include "NitfImageSubheaderV21.h"

#include "ImageSubheaderLayouts.h"

void CNitfImageSubheaderV21::read(FILE* fp, eNitfVersion_t version) {
    readWith(fp, version);
}

void CNitfImageSubheaderV21::write(FILE* fp) {
    writeWithLayout(fp);
}

__int64 CNitfImageSubheaderV21::computeStorageLength() {
    return storageLength();
}

void CNitfImageSubheaderV21::getTitle(char* title) {
    buildTitle("IID2", title);
}

const CRecordLayout& CNitfImageSubheaderV21::readLayout(eNitfVersion_t version) const {
    return imageSubheaderLayout21(version);
}

const CRecordLayout& CNitfImageSubheaderV21::writeLayout() const {
    return imageSubheaderLayout21(eNitfVersion21);
}
