#include "utils/UtilsFileSystem/LongPath.h"
