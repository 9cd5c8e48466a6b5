#include "tests/fileio/H264/H264TestSupport.h"

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <fstream>
#include <iterator>

namespace LumekTest
{
  namespace
  {
    VBytes ReadWholeFile( const std::string& i_rPath )
    {
      std::ifstream File( i_rPath, std::ios::binary );
      return VBytes( std::istreambuf_iterator< char >( File ), std::istreambuf_iterator< char >() );
    }

    const VBytes s_StartCode = { 0, 0, 0, 1 };
  } // namespace

  std::vector< VBytes > SplitNALUnits( const VBytes& i_rAnnexB )
  {
    std::vector< VBytes > Units;
    std::size_t i = 0, Start = std::string::npos;
    while( i + 2 < i_rAnnexB.size() )
    {
      if( i_rAnnexB[i] == 0 && i_rAnnexB[i + 1] == 0 && i_rAnnexB[i + 2] == 1 )
      {
        if( Start != std::string::npos )
        {
          std::size_t End = i;
          while( End > Start && i_rAnnexB[End - 1] == 0 )
            --End;
          Units.emplace_back( i_rAnnexB.begin() + Start, i_rAnnexB.begin() + End );
        }
        Start = i + 3;
        i += 3;
      }
      else
        ++i;
    }
    if( Start != std::string::npos )
      Units.emplace_back( i_rAnnexB.begin() + Start, i_rAnnexB.end() );
    return Units;
  }

  VH264Stream MakeH264Stream( std::int32_t i_Width, std::int32_t i_Height, int i_Frames, int i_KeyInterval,
                              const std::vector< std::string >& i_rEncoderArguments, const std::string& i_rPixelFormat )
  {
    VH264Stream Stream;
    Stream.Width = i_Width;
    Stream.Height = i_Height;
    std::vector< std::string > Arguments = { "-f",
                                             "lavfi",
                                             "-i",
                                             "testsrc2=size=" + std::to_string( i_Width ) + "x" +
                                                 std::to_string( i_Height ) + ":rate=25",
                                             "-frames:v",
                                             std::to_string( i_Frames ),
                                             "-pix_fmt",
                                             i_rPixelFormat,
                                             "-c:v",
                                             "libx264",
                                             "-bf",
                                             "0",
                                             "-g",
                                             std::to_string( i_KeyInterval ),
                                             "-keyint_min",
                                             std::to_string( i_KeyInterval ),
                                             "-sc_threshold",
                                             "0" };
    Arguments.insert( Arguments.end(), i_rEncoderArguments.begin(), i_rEncoderArguments.end() );
    Arguments.insert( Arguments.end(), { "-bsf:v", "h264_metadata=aud=insert" } );
    std::string Name = "h264_" + std::to_string( i_Width ) + "x" + std::to_string( i_Height ) + "_" +
                       std::to_string( i_Frames ) + ".h264";
    Stream.Path = FfmpegFixture( Name, Arguments );
    if( Stream.Path.empty() )
      return Stream;
    // Each access unit starts at its delimiter (type 9), which stays in the unit.
    for( const VBytes& rUnit : SplitNALUnits( ReadWholeFile( Stream.Path ) ) )
    {
      if( rUnit.empty() )
        continue;
      if( ( rUnit[0] & 0x1F ) == 9 || Stream.AccessUnits.empty() )
        Stream.AccessUnits.emplace_back();
      VBytes& rAccessUnit = Stream.AccessUnits.back();
      rAccessUnit.insert( rAccessUnit.end(), s_StartCode.begin(), s_StartCode.end() );
      rAccessUnit.insert( rAccessUnit.end(), rUnit.begin(), rUnit.end() );
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

  VLogCapture::VLogCapture( std::string i_Category ) : m_Category( std::move( i_Category ) )
  {
    m_Handle = ZOL::GlobalLog().AddSink(
        [this]( const ZOL::ILogRecord& i_rRecord )
        {
          if( i_rRecord.Category == m_Category )
            m_Lines.push_back( i_rRecord.Message );
        },
        ZOL::LogDetail );
  }

  VLogCapture::~VLogCapture()
  {
    ZOL::GlobalLog().RemoveSink( m_Handle );
  }

  bool VLogCapture::Contains( const std::string& i_rText ) const
  {
    return std::any_of( m_Lines.begin(), m_Lines.end(),
                        [&]( const std::string& i_rLine ) { return i_rLine.find( i_rText ) != std::string::npos; } );
  }

  VMemoryH264Reader::VMemoryH264Reader( const VH264Stream& i_rStream,
                                        const std::vector< std::uint64_t >& i_rFrameNumbers )
      : m_pAllocator( std::make_shared< ZOL::VReaderBufferAllocator >() )
  {
    for( std::size_t i = 0; i < i_rStream.AccessUnits.size(); ++i )
      m_Frames[i < i_rFrameNumbers.size() ? i_rFrameNumbers[i] : i] = i_rStream.AccessUnits[i];
    m_VideoInfo.ImageWidth = i_rStream.Width;
    m_VideoInfo.ImageHeight = i_rStream.Height;
    m_VideoInfo.PixelFormat = ZOL::PixelFormat_U8Y8V8Y8;
    m_Timing.FramePeriodInTicks = m_Timing.TicksPerSecond / 25;
  }

  std::uint64_t VMemoryH264Reader::GetFrameCount() const
  {
    return m_Frames.empty() ? 0 : m_Frames.rbegin()->first + 1;
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
    auto Found = m_Frames.upper_bound( i_FrameIndex );
    if( Found == m_Frames.begin() )
      return std::nullopt;
    return std::prev( Found )->first;
  }

  std::optional< std::uint64_t > VMemoryH264Reader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    const auto Found = m_Frames.lower_bound( i_FrameIndex );
    if( Found == m_Frames.end() )
      return std::nullopt;
    return Found->first;
  }
} // namespace LumekTest
