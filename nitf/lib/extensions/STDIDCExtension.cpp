#include "STDIDCExtension.h"

#include "TreTables.h"

void CSTDIDCExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::STDIDC());
}
