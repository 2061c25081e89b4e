#include "CSCRNAExtension.h"

#include "TreTables.h"

void CCSCRNAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSCRNA());
}
