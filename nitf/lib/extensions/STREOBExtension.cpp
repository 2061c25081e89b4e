#include "STREOBExtension.h"

#include "TreTables.h"

void CSTREOBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::STREOB());
}
