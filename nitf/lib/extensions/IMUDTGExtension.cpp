#include "IMUDTGExtension.h"

#include "TreTables.h"

void CIMUDTGExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::IMUDTG());
}
