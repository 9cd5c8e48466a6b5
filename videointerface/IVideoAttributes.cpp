#include "videointerface/IVideoAttributes.h"
