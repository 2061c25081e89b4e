#include "CSPROAExtension.h"

#include "TreTables.h"

void CCSPROAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::CSPROA());
}
