#include "CSSFAAExtension.h"

#include "TreTables.h"

void CCSSFAAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSSFAA());
}
