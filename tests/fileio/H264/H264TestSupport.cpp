#include "tests/fileio/H264/H264TestSupport.h"

#include "tests/support/FfmpegFixtures.h"

#include <fstream>
#include <iterator>

namespace LumekTest
{
  std::vector< VBytes > SplitNALUnits( const VBytes& i_rAnnexB )
  {
    std::vector< VBytes > Units;
    std::size_t i = 0, Start = std::string::npos;
    while( i + 2 < i_rAnnexB.size() )
    {
      if( i_rAnnexB[i] != 0 || i_rAnnexB[i + 1] != 0 || i_rAnnexB[i + 2] != 1 )
      {
        ++i;
        continue;
      }
      if( Start != std::string::npos )
      {
        std::size_t End = i;
        while( End > Start && i_rAnnexB[End - 1] == 0 )
          --End;
        Units.emplace_back( i_rAnnexB.begin() + Start, i_rAnnexB.begin() + End );
      }
      Start = i += 3;
    }
    if( Start != std::string::npos )
      Units.emplace_back( i_rAnnexB.begin() + Start, i_rAnnexB.end() );
    return Units;
  }

  VBytes JoinNALUnits( const std::vector< VBytes >& i_rUnits, bool i_bLengthPrefixed )
  {
    VBytes Out;
    for( const VBytes& rUnit : i_rUnits )
    {
      const std::uint32_t n = i_bLengthPrefixed ? static_cast< std::uint32_t >( rUnit.size() ) : 1;
      Out.insert( Out.end(),
                  { std::uint8_t( n >> 24 ), std::uint8_t( n >> 16 ), std::uint8_t( n >> 8 ), std::uint8_t( n ) } );
      Out.insert( Out.end(), rUnit.begin(), rUnit.end() );
    }
    return Out;
  }

  std::vector< VBytes > UnitsOfType( const VBytes& i_rAccessUnit, unsigned i_Type )
  {
    std::vector< VBytes > Units;
    for( const VBytes& rUnit : SplitNALUnits( i_rAccessUnit ) )
      if( !rUnit.empty() && ( rUnit[0] & 0x1Fu ) == i_Type )
        Units.push_back( rUnit );
    return Units;
  }

  VH264Stream MakeH264Stream( std::int32_t i_Width, std::int32_t i_Height, int i_Frames, int i_KeyInterval,
                              const std::vector< std::string >& i_rEncoderArguments, const std::string& i_rPixelFormat )
  {
    VH264Stream Stream;
    Stream.Width = i_Width;
    Stream.Height = i_Height;
    const std::string Size = std::to_string( i_Width ) + "x" + std::to_string( i_Height );
    const std::string Key = std::to_string( i_KeyInterval );
    std::vector< std::string > Arguments = { "-f",
                                             "lavfi",
                                             "-i",
                                             "testsrc2=size=" + Size + ":rate=25",
                                             "-frames:v",
                                             std::to_string( i_Frames ),
                                             "-pix_fmt",
                                             i_rPixelFormat,
                                             "-c:v",
                                             "libx264",
                                             "-bf",
                                             "0",
                                             "-g",
                                             Key,
                                             "-keyint_min",
                                             Key,
                                             "-sc_threshold",
                                             "0" };
    Arguments.insert( Arguments.end(), i_rEncoderArguments.begin(), i_rEncoderArguments.end() );
    Arguments.insert( Arguments.end(), { "-bsf:v", "h264_metadata=aud=insert" } );
    Stream.Path = FfmpegFixture( "h264_" + Size + "_" + std::to_string( i_Frames ) + ".h264", Arguments );
    if( Stream.Path.empty() )
      return Stream;
    std::ifstream File( Stream.Path, std::ios::binary );
    const VBytes Whole( ( std::istreambuf_iterator< char >( File ) ), std::istreambuf_iterator< char >() );
    // Each access unit starts at its delimiter (type 9), which stays in the unit.
    for( const VBytes& rUnit : SplitNALUnits( Whole ) )
    {
      if( rUnit.empty() )
        continue;
      if( ( rUnit[0] & 0x1F ) == 9 || Stream.AccessUnits.empty() )
        Stream.AccessUnits.emplace_back();
      const VBytes Unit = JoinNALUnits( { rUnit }, false );
      Stream.AccessUnits.back().insert( Stream.AccessUnits.back().end(), Unit.begin(), Unit.end() );
    }
    return Stream;
  }

  std::vector< VBytes > ExpectedUYVYFrames( const VH264Stream& i_rStream )
  {
    const VBytes Planar = FfmpegDecode( i_rStream.Path, "yuv420p" );
    const std::size_t W = static_cast< std::size_t >( i_rStream.Width );
    const std::size_t H = static_cast< std::size_t >( i_rStream.Height );
    const std::size_t FrameSize = W * H * 3 / 2;
    std::vector< VBytes > Frames;
    for( std::size_t Offset = 0; FrameSize > 0 && Offset + FrameSize <= Planar.size(); Offset += FrameSize )
    {
      const std::uint8_t* pY = Planar.data() + Offset;
      const std::uint8_t* pU = pY + W * H;
      const std::uint8_t* pV = pU + W * H / 4;
      VBytes Frame( W * H * 2 );
      for( std::size_t y = 0; y < H; ++y )
        for( std::size_t x = 0; x < W; x += 2 )
        {
          std::uint8_t* o = &Frame[( y * W + x ) * 2];
          o[0] = pU[( y / 2 ) * ( W / 2 ) + x / 2];
          o[1] = pY[y * W + x];
          o[2] = pV[( y / 2 ) * ( W / 2 ) + x / 2];
          o[3] = pY[y * W + x + 1];
        }
      Frames.push_back( std::move( Frame ) );
    }
    return Frames;
  }

  VMemoryH264Reader::VMemoryH264Reader( const VH264Stream& i_rStream,
                                        const std::vector< std::uint64_t >& i_rFrameNumbers )
  {
    for( std::size_t i = 0; i < i_rStream.AccessUnits.size(); ++i )
      m_Frames[i < i_rFrameNumbers.size() ? i_rFrameNumbers[i] : i] = i_rStream.AccessUnits[i];
    m_VideoInfo.ImageWidth = i_rStream.Width;
    m_VideoInfo.ImageHeight = i_rStream.Height;
    m_VideoInfo.PixelFormat = ZOL::PixelFormat_U8Y8V8Y8;
    m_Timing.FramePeriodInTicks = m_Timing.TicksPerSecond / 25;
  }

  bool VMemoryH264Reader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                         ZOL::IAudioBuffers&, bool i_bReadVideo, bool )
  {
    const auto Found = m_Frames.find( i_FrameIndex );
    if( Found == m_Frames.end() )
      return false;
    ++Reads;
    if( i_bReadVideo )
    {
      m_pAllocator->Allocate( o_rVideo, Found->second.size() );
      std::copy( Found->second.begin(), Found->second.end(), o_rVideo->GetData() );
    }
    return true;
  }

  std::optional< std::uint64_t > VMemoryH264Reader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    const auto Found = m_Frames.upper_bound( i_FrameIndex );
    return Found == m_Frames.begin() ? std::nullopt : std::optional< std::uint64_t >( std::prev( Found )->first );
  }

  std::optional< std::uint64_t > VMemoryH264Reader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    const auto Found = m_Frames.lower_bound( i_FrameIndex );
    return Found == m_Frames.end() ? std::nullopt : std::optional< std::uint64_t >( Found->first );
  }
} // namespace LumekTest
