#pragma once

// Picks the reader for a file by its name alone, never by its content.

#include "videointerface/IVideoReader.h"

#include <memory>
#include <string>

// A new, unopened reader for the file's container, or an empty pointer when the name names no
// container this build can read.
std::shared_ptr< ZOL::IVideoReader > CreateVideoReader( const std::string& i_FileName );
