#pragma once

// The one shape every reader opens in. A reader that opened another file before, or failed half
// way, must not answer with what it read then: Open closes what was open and empties the records,
// runs the reader's own open, and leaves the reader closed and empty when that fails.

#include "videointerface/IVideoReader.h"

#include <functional>
#include <string>

namespace ZOL
{
  class VVideoReaderBase : public IVideoReader
  {
  public:
    [[nodiscard]] bool Open( const std::string& i_rFileName ) final;

  protected:
    // The reader's own open, on a reader that is closed and empty.
    [[nodiscard]] virtual bool OpenReader( const std::string& i_rFileName ) = 0;
    // Back to the records of a new reader; Close alone keeps what its rules keep.
    virtual void Reset() = 0;
    // A reader whose container keeps value after a failure part way (a capture whose index was
    // cut off still has the frames before the cut) answers true here for that failure.
    virtual bool KeepsWhatAFailedOpenRead() const { return false; }

    // The shape itself, for readers with other ways in (a stream instead of a path).
    [[nodiscard]] bool OpenWith( const std::function< bool() >& i_rOpen );
  };
} // namespace ZOL
