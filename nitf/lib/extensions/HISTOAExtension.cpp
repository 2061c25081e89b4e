#include "HISTOAExtension.h"

#include "TreTables.h"

void CHISTOAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::HISTOA());
}
