#include "videointerface/Enumerations.h"
