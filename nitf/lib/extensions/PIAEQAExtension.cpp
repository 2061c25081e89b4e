#include "PIAEQAExtension.h"

#include "TreTables.h"

void CPIAEQAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::PIAEQA());
}
