#include "videointerface/AttributeRecords.h"
