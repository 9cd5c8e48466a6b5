#include "utils/UtilsIO/VLargeFile.h"
