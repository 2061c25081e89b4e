#include "GEOPSBExtension.h"

#include "TreTables.h"

void CGEOPSBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::GEOPSB());
}
