#pragma once

#include "services/Log.h"

// Every message of the Matroska reader goes to this category.
#define MKV_LOG( LEVEL, ... ) LUMEK_LOG( "MkvReader", LEVEL, __VA_ARGS__ )
