#include "USE00AExtension.h"

#include "TreTables.h"

void CUSE00AExtension::readInfo(FILE* fp) {
    readLayout(fp, tre::layouts::USE00A());
}
