#include "IOMAPAExtension.h"

#include "TreTables.h"

void CIOMAPAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::IOMAPA());
}
