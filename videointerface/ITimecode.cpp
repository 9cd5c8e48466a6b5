#include "videointerface/ITimecode.h"
