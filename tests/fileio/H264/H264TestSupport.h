#pragma once

// H.264 streams made by ffmpeg in the run, cut into access units, and a reader that serves them
// from memory so that the video source can be driven without a container that stores H.264.

#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"

#include <map>
#include <sstream>

namespace LumekTest
{
  struct VH264Stream
  {
    std::string Path;
    std::int32_t Width = 0;
    std::int32_t Height = 0;
    // Each unit in Annex B form, as a reader hands it to the decoder.
    std::vector< VBytes > AccessUnits;
  };

  // The units of an Annex B byte string without their start codes and the zeros before the next
  // one; only those of one type when i_Type is given (7 SPS, 8 PPS, 6 SEI).
  inline std::vector< VBytes > SplitNALUnits( const VBytes& i_rAnnexB, int i_Type = -1 )
  {
    std::vector< std::size_t > Starts;
    for( std::size_t i = 0; i + 2 < i_rAnnexB.size(); ++i )
      if( i_rAnnexB[i] == 0 && i_rAnnexB[i + 1] == 0 && i_rAnnexB[i + 2] == 1 )
        Starts.push_back( i + 3 );
    std::vector< VBytes > Units;
    for( std::size_t n = 0; n < Starts.size(); ++n )
    {
      const bool bLast = n + 1 == Starts.size();
      VBytes Unit( i_rAnnexB.begin() + Starts[n], bLast ? i_rAnnexB.end() : i_rAnnexB.begin() + Starts[n + 1] - 3 );
      while( !bLast && !Unit.empty() && Unit.back() == 0 )
        Unit.pop_back();
      if( i_Type < 0 || ( !Unit.empty() && ( Unit[0] & 0x1F ) == i_Type ) )
        Units.push_back( std::move( Unit ) );
    }
    return Units;
  }

  // The units joined again, behind 4-byte start codes or 4-byte big-endian lengths.
  inline VBytes JoinNALUnits( const std::vector< VBytes >& i_rUnits, bool i_bLengthPrefixed )
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

  // A libx264 stream without B-frames, a key frame every i_KeyInterval frames and an access
  // unit delimiter before each unit, so that it can be cut without parsing slices.
  inline VH264Stream MakeH264Stream( std::int32_t i_Width, std::int32_t i_Height, int i_Frames, int i_KeyInterval = 30,
                                     const std::string& i_rEncoderArguments = "-profile:v baseline",
                                     const std::string& i_rPixelFormat = "yuv420p" )
  {
    const std::string Size = std::to_string( i_Width ) + "x" + std::to_string( i_Height );
    const std::string Key = std::to_string( i_KeyInterval );
    std::istringstream Words( "-f lavfi -i testsrc2=size=" + Size + ":rate=25 -frames:v " + std::to_string( i_Frames ) +
                              " -pix_fmt " + i_rPixelFormat + " -c:v libx264 -bf 0 -g " + Key + " -keyint_min " + Key +
                              " -sc_threshold 0 " + i_rEncoderArguments + " -bsf:v h264_metadata=aud=insert" );
    VH264Stream Stream{ FfmpegFixture( "h264_" + Size + "_" + std::to_string( i_Frames ) + ".h264",
                                       { std::istream_iterator< std::string >( Words ), {} } ),
                        i_Width,
                        i_Height,
                        {} };
    // Each access unit starts at its delimiter (type 9), which stays in the unit.
    for( const VBytes& rUnit : SplitNALUnits( ReadWholeFile( Stream.Path ) ) )
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

  // ffmpeg's decode of the stream, each 4:2:0 frame packed to U8Y8V8Y8 by letting each chroma
  // row serve two rows, one vector a frame.
  inline std::vector< VBytes > ExpectedUYVYFrames( const VH264Stream& i_rStream )
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

  // A buffer over bytes the test holds.
  class VBytesBuffer : public ZOL::IBufferConst
  {
  public:
    explicit VBytesBuffer( const VBytes& i_rBytes ) : m_rBytes( i_rBytes ) {}
    const std::uint8_t* GetData() const override { return m_rBytes.data(); }
    std::uint64_t GetSize() const override { return m_rBytes.size(); }

  private:
    const VBytes& m_rBytes;
  };

  // Serves access units as an H.264 file would, under frame numbers the test chooses (gaps
  // allowed), and counts the reads.
  class VMemoryH264Reader : public ZOL::IVideoReader, public ZOL::IFrameIndexQueries
  {
  public:
    VMemoryH264Reader( const VH264Stream& i_rStream, const std::vector< std::uint64_t >& i_rFrameNumbers = {} )
    {
      for( std::size_t i = 0; i < i_rStream.AccessUnits.size(); ++i )
        m_Frames[i < i_rFrameNumbers.size() ? i_rFrameNumbers[i] : i] = i_rStream.AccessUnits[i];
      m_VideoInfo = FrameInfo( i_rStream.Width, i_rStream.Height, ZOL::PixelFormat_U8Y8V8Y8 );
      m_Timing.FramePeriodInTicks = m_Timing.TicksPerSecond / 25;
    }

    std::uint64_t Reads = 0;

    const ZOL::IVideoReaderCapabilities& GetCapabilities() const override { return m_Capabilities; }
    bool Open( const std::string& ) override { return true; }
    const ZOL::IVideoAttributes& GetAttributes() const override { return m_Attributes; }
    const ZOL::IVideoTiming& GetVideoTiming() const override { return m_Timing; }
    const ZOL::ITimecode& GetTimecode() const override { return m_Timecode; }
    ZOL::EAudioPayload GetAudioPayload() const override { return ZOL::AudioPayload_None; }
    const ZOL::IAudioFrameInfo& GetAudioFrameInfo() const override { return m_AudioInfo; }
    ZOL::EVideoPayload GetVideoPayload() const override { return ZOL::VideoPayload_VideoH264; }
    const ZOL::IVideoFrameInfo& GetVideoFrameInfo() const override { return m_VideoInfo; }
    const ZOL::IVideoSettings& GetVideoSettings() const override { return m_Settings; }
    std::uint64_t GetFrameCount() const override { return m_Frames.empty() ? 0 : m_Frames.rbegin()->first + 1; }
    bool HasFrame( std::uint64_t i_FrameIndex ) const override { return m_Frames.count( i_FrameIndex ) != 0; }
    bool ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo, ZOL::IAudioBuffers&,
                        bool i_bReadVideo, bool ) override
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
    void Close() override {}

    std::uint64_t GetStoredFrameCount() const override { return m_Frames.size(); }
    std::optional< std::uint64_t > FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const override
    {
      const auto Found = m_Frames.upper_bound( i_FrameIndex );
      return Found == m_Frames.begin() ? std::nullopt : std::optional< std::uint64_t >( std::prev( Found )->first );
    }
    std::optional< std::uint64_t > FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const override
    {
      const auto Found = m_Frames.lower_bound( i_FrameIndex );
      return Found == m_Frames.end() ? std::nullopt : std::optional< std::uint64_t >( Found->first );
    }

  private:
    ZOL::VReaderCapabilities m_Capabilities{
        {}, {}, ZOL::VReaderCapabilities::EveryPixelFormat(), { ZOL::VideoPayload_VideoH264 } };
    std::map< std::uint64_t, VBytes > m_Frames;
    std::shared_ptr< ZOL::VReaderBufferAllocator > m_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();
    ZOL::IVideoAttributes m_Attributes;
    ZOL::IVideoTiming m_Timing;
    ZOL::ITimecode m_Timecode;
    ZOL::IAudioFrameInfo m_AudioInfo;
    ZOL::IVideoFrameInfo m_VideoInfo;
    ZOL::IVideoSettings m_Settings;
  };
} // namespace LumekTest
