#include "ACFTBExtension.h"

#include "TreTables.h"

void CACFTBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::ACFTB());
}
