#include "PIAPEAExtension.h"

#include "TreTables.h"

void CPIAPEAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAPEA());
}
