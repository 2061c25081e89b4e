#include "CSCCGAExtension.h"

#include "TreTables.h"

void CCSCCGAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSCCGA());
}
