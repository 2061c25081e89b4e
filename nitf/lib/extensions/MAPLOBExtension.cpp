#include "MAPLOBExtension.h"

#include "TreTables.h"

void CMAPLOBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::MAPLOB());
}
