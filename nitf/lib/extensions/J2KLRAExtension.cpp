#include "J2KLRAExtension.h"

#include "TreTables.h"

void CJ2KLRAExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::J2KLRA());
}
