#include "PIAPRExtension.h"

#include "TreTables.h"

void CPIAPRExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAPR());
}
