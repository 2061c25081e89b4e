#include "ESD001Extension.h"

#include "TreTables.h"

void CESD001Extension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::ESD001());
}
