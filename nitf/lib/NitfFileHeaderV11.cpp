#include "NitfFileHeaderV11.h"
