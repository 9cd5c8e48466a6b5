#include "videointerface/ReaderCapabilities.h"

namespace ZOL
{
  namespace
  {
    template < typename T, std::size_t N > std::bitset< N > SetOf( const std::vector< T >& i_rValues )
    {
      std::bitset< N > Set;
      for( const T Value : i_rValues )
        if( static_cast< std::size_t >( Value ) < N )
          Set.set( static_cast< std::size_t >( Value ) );
      return Set;
    }

    template < std::size_t N, typename T > bool Has( const std::bitset< N >& i_rSet, T i_Value )
    {
      return static_cast< std::size_t >( i_Value ) < N && i_rSet.test( static_cast< std::size_t >( i_Value ) );
    }
  } // namespace

  VReaderCapabilities::VReaderCapabilities( const std::vector< EAudioSampleFormat >& i_SampleFormats,
                                            const std::vector< EAudioPayload >& i_AudioPayloads,
                                            const std::vector< EPixelFormat >& i_PixelFormats,
                                            const std::vector< EVideoPayload >& i_VideoPayloads )
      : m_SampleFormats( SetOf< EAudioSampleFormat, MaxValue >( i_SampleFormats ) ),
        m_AudioPayloads( SetOf< EAudioPayload, MaxValue >( i_AudioPayloads ) ),
        m_PixelFormats( SetOf< EPixelFormat, MaxValue >( i_PixelFormats ) ),
        m_VideoPayloads( SetOf< EVideoPayload, MaxValue >( i_VideoPayloads ) )
  {
    static_assert( PixelFormatCount <= MaxValue, "a pixel format beyond what the capability sets hold" );
  }

  std::vector< EPixelFormat > VReaderCapabilities::EveryPixelFormat()
  {
#define LUMEK_PIXEL_FORMAT_ITEM( NAME, VALUE ) PixelFormat_##NAME,
    return { LUMEK_PIXEL_FORMATS( LUMEK_PIXEL_FORMAT_ITEM ) };
#undef LUMEK_PIXEL_FORMAT_ITEM
  }

  bool VReaderCapabilities::SupportsAudioSampleFormat( EAudioSampleFormat i_Format ) const
  {
    return Has( m_SampleFormats, i_Format );
  }

  bool VReaderCapabilities::SupportsAudioPayload( EAudioPayload i_Payload ) const
  {
    return Has( m_AudioPayloads, i_Payload );
  }

  bool VReaderCapabilities::SupportsPixelFormat( EPixelFormat i_Format ) const
  {
    return Has( m_PixelFormats, i_Format );
  }

  bool VReaderCapabilities::SupportsVideoPayload( EVideoPayload i_Payload ) const
  {
    return Has( m_VideoPayloads, i_Payload );
  }
} // namespace ZOL
