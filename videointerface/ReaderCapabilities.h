#pragma once

// What a reader can yield, as four lists: the one form every reader's capabilities take.

#include "videointerface/IVideoReader.h"

#include <bitset>
#include <vector>

namespace ZOL
{
  class VReaderCapabilities : public IVideoReaderCapabilities
  {
  public:
    VReaderCapabilities( const std::vector< EAudioSampleFormat >& i_SampleFormats,
                         const std::vector< EAudioPayload >& i_AudioPayloads,
                         const std::vector< EPixelFormat >& i_PixelFormats,
                         const std::vector< EVideoPayload >& i_VideoPayloads );

    // Every pixel format there is, for readers whose frames can be stored in any.
    static std::vector< EPixelFormat > EveryPixelFormat();

    bool SupportsAudioSampleFormat( EAudioSampleFormat i_Format ) const override;
    bool SupportsAudioPayload( EAudioPayload i_Payload ) const override;
    bool SupportsPixelFormat( EPixelFormat i_Format ) const override;
    bool SupportsVideoPayload( EVideoPayload i_Payload ) const override;

  private:
    static constexpr std::size_t MaxValue = 32;
    std::bitset< MaxValue > m_SampleFormats;
    std::bitset< MaxValue > m_AudioPayloads;
    std::bitset< MaxValue > m_PixelFormats;
    std::bitset< MaxValue > m_VideoPayloads;
  };
} // namespace ZOL
