#include "PIAIMCExtension.h"

#include "TreTables.h"

void CPIAIMCExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAIMC());
}
