#include "JITCIDExtension.h"

#include "TreTables.h"

void CJITCIDExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::JITCID());
}
