#include "PRJPSBExtension.h"

#include "TreTables.h"

void CPRJPSBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PRJPSB());
}
