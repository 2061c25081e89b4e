#include "TESTINExtension.h"

#include "TreTables.h"

void CTESTINExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::TESTIN());
}
