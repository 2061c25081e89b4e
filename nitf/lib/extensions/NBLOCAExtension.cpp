#include "NBLOCAExtension.h"

#include "TreTables.h"

void CNBLOCAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::NBLOCA());
}
