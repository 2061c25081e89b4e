#include "CSDIDAExtension.h"

#include "TreTables.h"

void CCSDIDAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSDIDA());
}
