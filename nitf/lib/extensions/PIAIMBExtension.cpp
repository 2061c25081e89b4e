#include "PIAIMBExtension.h"

#include "TreTables.h"

void CPIAIMBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAIMB());
}
