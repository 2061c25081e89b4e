#include "ENGRDAExtension.h"

#include "TreTables.h"

void CENGRDAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::ENGRDA());
}
