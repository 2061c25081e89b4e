#include "ICHIPBExtension.h"

#include "TreTables.h"

void CICHIPBExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::ICHIPB());
}
