#include "PIATGBExtension.h"

#include "TreTables.h"

void CPIATGBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIATGB());
}
