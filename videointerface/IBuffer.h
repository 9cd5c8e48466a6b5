#pragma once

// The video model's buffers. They live with the streams in utils, which write them too; this
// header brings them in for the model and its readers.

#include "utils/UtilsMemory/Buffers.h"
