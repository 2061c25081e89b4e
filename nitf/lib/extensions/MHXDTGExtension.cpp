#include "MHXDTGExtension.h"

#include "TreTables.h"

void CMHXDTGExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::MHXDTG());
}
