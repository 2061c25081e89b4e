#include "AIMIDBExtension.h"

#include "TreTables.h"

void CAIMIDBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::AIMIDB());
}
