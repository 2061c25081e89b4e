#include "PIAEVAExtension.h"

#include "TreTables.h"

void CPIAEVAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAEVA());
}
