#include "CSEXRAExtension.h"

#include "TreTables.h"

void CCSEXRAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSEXRA());
}
