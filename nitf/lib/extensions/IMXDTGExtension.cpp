#include "IMXDTGExtension.h"

#include "TreTables.h"

void CIMXDTGExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::IMXDTG());
}
