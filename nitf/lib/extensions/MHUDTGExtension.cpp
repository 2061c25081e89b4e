#include "MHUDTGExtension.h"

#include "TreTables.h"

void CMHUDTGExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::MHUDTG());
}
