#include "PIAPEBExtension.h"

#include "TreTables.h"

void CPIAPEBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAPEB());
}
