#include "BANDSBExtension.h"

#include "TreTables.h"

void CBANDSBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::BANDSB());
}
