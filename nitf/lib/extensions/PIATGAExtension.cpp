#include "PIATGAExtension.h"

#include "TreTables.h"

void CPIATGAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIATGA());
}
