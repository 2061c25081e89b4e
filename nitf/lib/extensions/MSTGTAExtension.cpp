#include "MSTGTAExtension.h"

#include "TreTables.h"

void CMSTGTAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::MSTGTA());
}
