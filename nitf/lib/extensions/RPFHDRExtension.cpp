#include "RPFHDRExtension.h"

#include "TreTables.h"

void CRPFHDRExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::RPFHDR());
}
