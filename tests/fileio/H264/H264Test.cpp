// H.264: the RBSP reader and writer, stream forms, unit descriptions and libx264's parameter sets
// written back bit for bit; the decoder and the video source against ffmpeg's decode. libx264
// streams are cut into access units, which a reader serves from memory to the video source.

#include "app/VideoSource/VVideoSource.h"
#include "fileio/H264IO/VH264Decoder.h"
#include "fileio/H264Utils/H264BitStream.h"
#include "fileio/H264Utils/H264Utils.h"
#include "tests/fileio/ImageDecoders/ImageTestSupport.h"
#include "tests/support/FfmpegFixtures.h"
#include "videointerface/IVideoReader.h"
#include "videointerface/ReaderCapabilities.h"

#include <gtest/gtest.h>

#include <array>
#include <map>
#include <random>
#include <sstream>

namespace
{
  using namespace H264Utils;
  using namespace LumekTest;
  using LumekVideoViewer::VVideoSource;

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
  std::vector< VBytes > SplitNALUnits( const VBytes& i_rAnnexB, int i_Type = -1 )
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

  // A libx264 stream without B-frames, a key frame every i_KeyInterval frames and an access
  // unit delimiter before each unit, so that it can be cut without parsing slices.
  VH264Stream MakeH264Stream( std::int32_t i_Width, std::int32_t i_Height, int i_Frames, int i_KeyInterval,
                              const std::string& i_rEncoderArguments = "-profile:v baseline" )
  {
    const std::string Size = std::to_string( i_Width ) + "x" + std::to_string( i_Height );
    const std::string Key = std::to_string( i_KeyInterval );
    std::istringstream Words( "-f lavfi -i testsrc2=size=" + Size + ":rate=25 -frames:v " + std::to_string( i_Frames ) +
                              " -pix_fmt yuv420p -c:v libx264 -bf 0 -g " + Key + " -keyint_min " + Key +
                              " -sc_threshold 0 " + i_rEncoderArguments + " -bsf:v h264_metadata=aud=insert" );
    VH264Stream Stream{ FfmpegFixture( "h264_" + Size + "_" + std::to_string( i_Frames ) + ".h264",
                                       { std::istream_iterator< std::string >( Words ), {} } ),
                        i_Width,
                        i_Height,
                        {} };
    // Each access unit starts at its delimiter (type 9), which stays in the unit.
    for( const VBytes& rUnit : SplitNALUnits( ReadFileBytes( Stream.Path ) ) )
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
  std::vector< VBytes > ExpectedUYVYFrames( const VH264Stream& i_rStream )
  {
    const VBytes Planar = FfmpegDecode( i_rStream.Path, "yuv420p" );
    const std::size_t W = i_rStream.Width, H = i_rStream.Height, FrameSize = W * H * 3 / 2;
    std::vector< VBytes > Frames;
    for( std::size_t Offset = 0; Offset + FrameSize <= Planar.size(); Offset += FrameSize )
    {
      const std::uint8_t* pY = Planar.data() + Offset;
      const std::uint8_t* pU = pY + W * H;
      const std::uint8_t* pV = pU + W * H / 4;
      VBytes Frame;
      for( std::size_t y = 0; y < H; ++y )
        for( std::size_t x = 0; x < W; x += 2 )
        {
          const std::size_t C = ( y / 2 ) * ( W / 2 ) + x / 2;
          Frame.insert( Frame.end(), { pU[C], pY[y * W + x], pV[C], pY[y * W + x + 1] } );
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

  VBytes Clean( const VBytes& i_rStored )
  {
    VInputBitStream Stream( i_rStored.data(), i_rStored.size() );
    return VBytes( Stream.GetData(), Stream.GetData() + Stream.GetSize() );
  }

  TEST( BitStream, EmulationPreventionIsRemovedAndRestored )
  {
    // Stored, clean, and what the writer makes of the clean bytes: it escapes only where the
    // reader would drop.
    const std::tuple< const char*, VBytes, VBytes, VBytes > Cases[] = {
        { "FollowedByFourIsNoEscape", { 0, 0, 3, 4 }, { 0, 0, 3, 4 }, { 0, 0, 3, 3, 4 } },
        { "FollowedByOneIsAnEscape", { 0, 0, 3, 1, 7 }, { 0, 0, 1, 7 }, { 0, 0, 3, 1, 7 } },
        { "EscapeAtTheEnd", { 0, 0, 3, 1 }, { 0, 0, 1 }, { 0, 0, 1 } },
        { "FinalTripletStays", { 7, 0, 0, 3 }, { 7, 0, 0, 3 }, { 7, 0, 0, 3 } },
        { "TwoEscapesInARow", { 0, 0, 3, 0, 0, 3, 2, 9 }, { 0, 0, 0, 0, 2, 9 }, { 0, 0, 0, 0, 3, 2, 9 } },
        { "EscapedThree", { 0, 0, 3, 3, 5 }, { 0, 0, 3, 5 }, { 0, 0, 3, 3, 5 } },
        { "NoZeroPair", { 0, 1, 3, 1 }, { 0, 1, 3, 1 }, { 0, 1, 3, 1 } },
    };
    for( const auto& [pName, rStored, rClean, rWritten] : Cases )
    {
      SCOPED_TRACE( pName );
      EXPECT_EQ( Clean( rStored ), rClean );
      VBytes Restored;
      InsertEmulationPrevention( rClean.data(), rClean.size(), Restored );
      EXPECT_EQ( Restored, rWritten );
      EXPECT_EQ( Clean( Restored ), rClean );
    }
  }

  TEST( BitStream, CodesAreTheStandardsOwnAndRandomSyntaxSurvivesTheRoundTrip )
  {
    // ue 0 = 1, ue 3 = 00100, se -1 = 011, se 2 = 00100, 3 bits 101, stop bit: 10010001 10010010 11000000.
    VOutputBitStream Known;
    Known.WriteUE( 0 );
    Known.WriteUE( 3 );
    Known.WriteSE( -1 );
    Known.WriteSE( 2 );
    Known.WriteBits( 5, 3 );
    Known.WriteTrailingBits();
    EXPECT_EQ( Known.Emit(), ( VBytes{ 0x91, 0x92, 0xC0 } ) );

    // Items of kind 0 (bits), 1 (ue) and 2 (se), mostly small, so that zero pairs and escapes
    // are frequent.
    std::mt19937 Random( 11 );
    std::vector< std::array< std::uint32_t, 3 > > Items; // kind, value, bit count
    VOutputBitStream Out;
    for( int i = 0; i < 3000; ++i )
    {
      const std::uint32_t Kind = Random() % 3, Bits = 1 + Random() % 32;
      std::uint32_t Value = Random() % 4 == 0 ? static_cast< std::uint32_t >( Random() ) : Random() % 4;
      if( Kind == 0 )
        Out.WriteBits( Value &= Bits == 32 ? 0xFFFFFFFFu : ( 1u << Bits ) - 1, Bits );
      else if( Kind == 1 )
        Out.WriteUE( Value = std::min< std::uint32_t >( Value, 0xFFFFFFFE ) );
      else
        Out.WriteSE( static_cast< std::int32_t >( Value ) );
      Items.push_back( { Kind, Value, Bits } );
    }
    Out.WriteTrailingBits();
    const VBytes Written = Out.Emit();
    VInputBitStream In( Written.data(), Written.size() );
    for( const auto& [Kind, Value, Bits] : Items )
      ASSERT_EQ( Kind == 0 ? In.ReadBits( Bits ) : Kind == 1 ? In.ReadUE() : std::uint32_t( In.ReadSE() ), Value );
    EXPECT_FALSE( In.MoreRBSPData() );
    EXPECT_TRUE( In.ReadTrailingBits() && In.IsValid() );
  }

  TEST( BitStream, BadEndsInvalidateAndSayWhatFailed )
  {
    const VBytes One = { 0xFF };
    VInputBitStream Short( One.data(), One.size() );
    EXPECT_EQ( Short.ReadBits( 9 ), 0u );
    EXPECT_FALSE( Short.IsValid() );
    EXPECT_EQ( Short.ReadBit(), 0u );
    // 32 leading zeros hold no 32-bit value.
    const VBytes Long = { 0, 0, 0, 0, 0x80, 0xFF, 0xFF, 0xFF, 0xFF };
    VInputBitStream Huge( Long.data(), Long.size() );
    EXPECT_EQ( Huge.ReadUE(), 0u );
    EXPECT_FALSE( Huge.IsValid() );

    VLogCapture Log( "H264Utils" );
    const VBytes Forbidden = { 0x85 }, NoStop = { 0x00 }, DirtyTail = { 0x81 };
    VNALHeader Header;
    EXPECT_FALSE( VInputBitStream( Forbidden.data(), 1 ).ReadNALHeader( Header ) );
    EXPECT_FALSE( VInputBitStream( NoStop.data(), 1 ).ReadTrailingBits() );
    EXPECT_FALSE( VInputBitStream( DirtyTail.data(), 1 ).ReadTrailingBits() );
    VOutputBitStream Out;
    Out.WriteBits( 1, 3 );
    EXPECT_EQ( Out.GetByteCount(), 1u );
    EXPECT_EQ( Log.Messages,
               ( std::vector< std::string >{ "Forbidden zero bit was not zero.", "Stop bit was not set.",
                                             "Trailing bits were not zero.",
                                             "Bit position of a buffer is not a whole number of bytes." } ) );
  }

  // The allocator hands itself to its buffers, so it lives in a shared pointer.
  const auto s_pAllocator = std::make_shared< ZOL::VReaderBufferAllocator >();

  std::shared_ptr< ZOL::IBuffer > Prefixed( const VBytes& i_rAnnexB )
  {
    std::shared_ptr< ZOL::IBuffer > pOut;
    EXPECT_TRUE( AnnexBToLengthPrefixed( i_rAnnexB.data(), i_rAnnexB.size(), pOut, *s_pAllocator ) );
    return pOut;
  }

  TEST( StreamUtils, FormsConvertBothWaysAndLengthsAreChecked )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    ASSERT_EQ( Stream.AccessUnits.size(), 12u );
    for( const VBytes& rUnit : Stream.AccessUnits )
    {
      const auto pPrefixed = Prefixed( rUnit );
      EXPECT_EQ( Bytes( pPrefixed ), JoinNALUnits( SplitNALUnits( rUnit ), true ) );
      std::shared_ptr< ZOL::IBuffer > pAnnexB;
      ASSERT_TRUE( LengthPrefixedToAnnexB( pPrefixed->GetData(), pPrefixed->GetSize(), pAnnexB, *s_pAllocator ) );
      EXPECT_EQ( Bytes( pAnnexB ), JoinNALUnits( SplitNALUnits( rUnit ), false ) );
    }
    // Key frames every 5: the IDR slice and the parameter sets are found in both forms.
    const auto pKey = Prefixed( Stream.AccessUnits[5] );
    const auto pOther = Prefixed( Stream.AccessUnits[6] );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pKey, H264NALUnitType_SPS ) );
    EXPECT_FALSE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceIDR ) );
    EXPECT_TRUE( ContainsNALUnit( *pOther, H264NALUnitType_CodedSliceNonIDR ) );
    EXPECT_TRUE( ContainsNALUnit( VBytesBuffer( Stream.AccessUnits[5] ), H264NALUnitType_CodedSliceIDR,
                                  EH264StreamForm::AnnexB ) );
    char SliceType = 0;
    EXPECT_TRUE( IsSingleSlice( *pKey, SliceType ) && SliceType == 'I' );
    EXPECT_TRUE( IsSingleSlice( *pOther, SliceType ) && SliceType == 'P' );

    // Junk before the first start code is no unit; a 3-byte code is as good as a 4-byte one.
    const VBytes Input = { 0xAA, 0, 0, 1, 0x09, 0xF0, 0, 0, 0, 1, 0x67, 0x42, 0, 0, 1, 0x68 };
    EXPECT_EQ( Bytes( *Prefixed( Input ) ), JoinNALUnits( { { 0x09, 0xF0 }, { 0x67, 0x42 }, { 0x68 } }, true ) );

    // A list of one buffer is handed back uncopied; the shared start code is 00 00 00 01.
    VBufferList One = { StartCodeBuffer() };
    EXPECT_EQ( JoinBuffers( One, *s_pAllocator ), StartCodeBuffer() );
    EXPECT_EQ( Bytes( *StartCodeBuffer() ), ( VBytes{ 0, 0, 0, 1 } ) );

    // Lengths that do not walk exactly to the end are refused, at every cut.
    std::shared_ptr< ZOL::IBuffer > pOut;
    EXPECT_TRUE( LengthPrefixedToAnnexB( nullptr, 0, pOut, *s_pAllocator ) && pOut && pOut->GetSize() == 0 );
    const VBytes Sample = JoinNALUnits( { { 0x65, 1, 2, 3 }, { 0x41, 9 } }, true );
    for( std::size_t Cut = 1; Cut < Sample.size(); ++Cut )
      EXPECT_EQ( LengthPrefixedToAnnexB( Sample.data(), Cut, pOut, *s_pAllocator ), Cut == 8 ) << "cut " << Cut;
    VBytes Lying = Sample;
    Lying[0] = 0xFF; // a length of four gigabytes
    EXPECT_FALSE( LengthPrefixedToAnnexB( Lying.data(), Lying.size(), pOut, *s_pAllocator ) );
    EXPECT_FALSE( ContainsNALUnit( VBytesBuffer( Lying ), H264NALUnitType_CodedSliceNonIDR ) );
  }

  TEST( DescribeNALUnit, NamesEachKindOfUnit )
  {
    std::ostringstream Text;
    // A non-IDR slice (first_mb 0, slice_type 5, P), indented; an SEI with a pic_timing and an
    // unregistered message of one byte each; a unit with the forbidden bit set.
    for( const auto& [rUnit, Indent] :
         { std::pair( VBytes{ 0x41, 0x9A }, 2 ),
           std::pair( VBytes{ 0x06, 0x01, 0x01, 0x10, 0x05, 0x01, 0x77, 0x80 }, 0 ), std::pair( VBytes{ 0x88 }, 0 ) } )
      DescribeNALUnit( rUnit.data(), rUnit.size(), Text, Indent, std::nullopt );
    EXPECT_EQ( Text.str(), "  CodedSliceNonIDR:\n"
                           "    Type: PSlice5\n"
                           "SEI:\n"
                           "  Type: PicTiming Size: 1\n"
                           "    Can't parse SEI Picture Timing without SPS.\n"
                           "  Type: UserDataUnregistered Size: 1\n"
                           "Unspecified:\n" );
  }

  TEST( ParameterSets, LibX264sReadBackAndWriteTheSameBits )
  {
    if( !HaveFfmpeg() )
      GTEST_SKIP() << "ffmpeg is not installed";
    // The encoder's arguments, the profile they give, and whether the SPS has HRD and picture
    // timing, with which the SEI is described.
    const std::tuple< const char*, std::uint32_t, bool > Encoders[] = {
        { "-profile:v high -x264-params cqm=jvt", 100, false },
        { "-profile:v main -b:v 300k -maxrate 300k -bufsize 600k -x264-params nal-hrd=cbr:force-cfr=1:pic-struct=1", 77,
          true },
        { "-profile:v high -color_primaries bt709 -color_trc bt709 -colorspace bt709 -x264-params sar=4/3", 100,
          false },
    };
    for( const auto& [pArguments, Profile, bTiming] : Encoders )
    {
      SCOPED_TRACE( pArguments );
      const VH264Stream Stream = MakeH264Stream( 98, 62, 3, 30, pArguments );
      ASSERT_FALSE( Stream.AccessUnits.empty() );
      const VBytes SPSUnit = SplitNALUnits( Stream.AccessUnits[0], 7 ).at( 0 );
      const VBytes PPSUnit = SplitNALUnits( Stream.AccessUnits[0], 8 ).at( 0 );
      VH264SPS SPS;
      ASSERT_TRUE( ParseSPS( SPSUnit.data(), SPSUnit.size(), SPS ) );
      EXPECT_EQ( std::tuple( SPS.profile_idc, SPS.GetWidth(), SPS.GetHeight() ), std::tuple( Profile, 98u, 62u ) );
      // Compared without emulation prevention: the writer leaves a zero third byte unescaped
      // where an encoder escapes it.
      VBytes Written;
      ASSERT_TRUE( WriteSPS( SPS, Written ) );
      EXPECT_EQ( Clean( Written ), Clean( SPSUnit ) );
      VH264SPS Again;
      ASSERT_TRUE( ParseSPS( Written.data(), Written.size(), Again ) );
      VH264PPS PPS;
      ASSERT_TRUE( ParsePPS( PPSUnit.data(), PPSUnit.size(), PPS, &SPS ) );
      ASSERT_TRUE( WritePPS( PPS, Written, &SPS ) );
      EXPECT_EQ( Clean( Written ), Clean( PPSUnit ) );
      // Every shorter unit is refused or read without harm, never read past its end.
      for( std::size_t Cut = 0; Cut < SPSUnit.size(); ++Cut )
        (void)ParseSPS( VBytes( SPSUnit.begin(), SPSUnit.begin() + Cut ).data(), Cut, Again );
      if( !bTiming )
        continue;
      ASSERT_TRUE( SPS.vui.nal_hrd_parameters_present_flag && SPS.vui.pic_struct_present_flag );
      EXPECT_EQ( std::tuple( SPS.vui.num_units_in_tick, SPS.vui.time_scale ), std::tuple( 1u, 50u ) );
      std::ostringstream Text;
      for( const VBytes& rSEI : SplitNALUnits( Stream.AccessUnits[0], 6 ) )
        DescribeNALUnit( rSEI.data(), rSEI.size(), Text, 0, SPS );
      // The first picture is removed and output at once; libx264 writes no clock timestamps.
      EXPECT_NE( Text.str().find( "  Type: PicTiming Size: " ), std::string::npos ) << Text.str();
      EXPECT_NE( Text.str().find( "    CPBRemovalDelay: 0\n"
                                  "    DPBOutputDelay: 0\n"
                                  "    Timecode[0]: 00:00:00:00 (0)\n"
                                  "    Timecode[1]: 00:00:00:00 (0)\n"
                                  "    Timecode[2]: 00:00:00:00 (0)\n" ),
                 std::string::npos )
          << Text.str();
    }
  }

  // An SPS up to pic_order_cnt_type 1 and a cycle length the stream cannot hold.
  VBytes SPSWithCycleLength( std::uint32_t i_Length )
  {
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 7 } );
    for( std::uint32_t Byte : { 66, 0, 30 } ) // profile, constraints, level
      Out.WriteBits( Byte, 8 );
    for( std::uint32_t Code : { 0, 0, 1 } ) // id, log2_max_frame_num_minus4, pic_order_cnt_type
      Out.WriteUE( Code );
    Out.WriteBit( 0 );
    Out.WriteSE( 0 );
    Out.WriteSE( 0 );
    Out.WriteUE( i_Length );
    Out.WriteTrailingBits();
    return Out.Emit();
  }

  TEST( ParameterSets, CountsBeyondTheStandardOrTheDataAreRefused )
  {
    VH264SPS SPS;
    // 255 is allowed by the standard but this unit stops long before 255 offsets.
    for( std::uint32_t Length : { 255u, 0x7FFFFFFFu } )
    {
      const VBytes Unit = SPSWithCycleLength( Length );
      EXPECT_FALSE( ParseSPS( Unit.data(), Unit.size(), SPS ) ) << Length;
    }
    EXPECT_TRUE( SPS.offset_for_ref_frame.empty() );

    // A slice group map that claims a billion map units in a dozen bytes.
    VOutputBitStream Out;
    Out.WriteNALHeader( { 3, 8 } );
    for( std::uint32_t Code : { 0, 0 } ) // pic_parameter_set_id, seq_parameter_set_id
      Out.WriteUE( Code );
    Out.WriteBits( 0, 2 ); // entropy_coding_mode_flag, bottom_field_pic_order_in_frame_present_flag
    for( std::uint32_t Code : { 3, 6, 1000000000 } ) // num_slice_groups_minus1, map type 6, map units
      Out.WriteUE( Code );
    Out.WriteTrailingBits();
    const VBytes PPSBytes = Out.Emit();
    VH264PPS PPS;
    EXPECT_FALSE( ParsePPS( PPSBytes.data(), PPSBytes.size(), PPS ) );

    // The writer refuses a record whose lists disagree with its counts.
    VH264SPS Record;
    Record.pic_order_cnt_type = 1;
    Record.num_ref_frames_in_pic_order_cnt_cycle = 2;
    VBytes Written;
    EXPECT_FALSE( WriteSPS( Record, Written ) );
    Record.offset_for_ref_frame = { 4, -4 };
    ASSERT_TRUE( WriteSPS( Record, Written ) );
    ASSERT_TRUE( ParseSPS( Written.data(), Written.size(), SPS ) );
    EXPECT_EQ( SPS.offset_for_ref_frame, ( std::vector< std::int32_t >{ 4, -4 } ) );
  }

  // One decode of one access unit by a decoder made for it, or by the one given.
  struct VDecode
  {
    VDecode( const VBytes& i_rUnit, ZOL::EPixelFormat i_Wish, ZOL::IH264Decoder* i_pDecoder = nullptr )
    {
      const auto pOwn = H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
      bDecoded = ( i_pDecoder ? *i_pDecoder : *pOwn ).Decode( VBytesBuffer( i_rUnit ), i_Wish, pOutput, Info );
    }
    bool bDecoded;
    std::shared_ptr< ZOL::IBuffer > pOutput;
    ZOL::IVideoFrameInfo Info;
  };

  struct H264Decoder : ::testing::Test
  {
    void SetUp() override
    {
      if( !HaveFfmpeg() )
        GTEST_SKIP() << "ffmpeg is not installed";
    }
  };

  TEST_F( H264Decoder, EveryFrameEqualsFfmpegsInTheWishedPacking )
  {
    // 98 x 62 is not a whole number of macroblocks: the stream crops.
    for( const auto& [Width, Height, pProfile] : { std::tuple( 98, 62, "baseline" ), std::tuple( 80, 48, "main" ) } )
    {
      SCOPED_TRACE( pProfile );
      const VH264Stream Stream = MakeH264Stream( Width, Height, 12, 5, std::string( "-profile:v " ) + pProfile );
      const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
      ASSERT_EQ( Stream.AccessUnits.size(), 12u );
      ASSERT_EQ( Expected.size(), 12u );
      const auto pDecoder = H264IO::VH264Decoder::Create( std::make_shared< ZOL::VFrameBufferAllocator >() );
      for( std::size_t i = 0; i < Stream.AccessUnits.size(); ++i )
      {
        const VDecode Frame( Stream.AccessUnits[i], ZOL::PixelFormat_U8Y8V8Y8, pDecoder.get() );
        ASSERT_TRUE( Frame.bDecoded ) << i;
        EXPECT_EQ( std::tie( Frame.Info.ImageWidth, Frame.Info.ImageHeight, Frame.Info.PixelFormat ),
                   std::tuple( Width, Height, ZOL::PixelFormat_U8Y8V8Y8 ) );
        EXPECT_EQ( Bytes( Frame.pOutput ), Expected[i] ) << "frame " << i;
      }
      // The other packing when asked for, U8Y8V8Y8 for any other wish.
      VBytes Swapped = Expected[0];
      for( std::size_t i = 0; i + 1 < Swapped.size(); i += 2 )
        std::swap( Swapped[i], Swapped[i + 1] );
      const VDecode Other( Stream.AccessUnits[0], ZOL::PixelFormat_Y8U8Y8V8 );
      EXPECT_EQ( std::tuple( Other.bDecoded, Other.Info.PixelFormat, Bytes( Other.pOutput ) ),
                 std::tuple( true, ZOL::PixelFormat_Y8U8Y8V8, Swapped ) );
      const VDecode Any( Stream.AccessUnits[0], ZOL::PixelFormat_R8G8B8 );
      EXPECT_EQ( std::tuple( Any.bDecoded, Any.Info.PixelFormat, Bytes( Any.pOutput ) ),
                 std::tuple( true, ZOL::PixelFormat_U8Y8V8Y8, Expected[0] ) );
    }
  }

  TEST_F( H264Decoder, UnitsWithoutAPictureGiveNoFrameAndSaySo )
  {
    const VH264Stream Stream = MakeH264Stream( 64, 48, 12, 5 );
    std::vector< VBytes > Sets = SplitNALUnits( Stream.AccessUnits.at( 0 ), 7 );
    Sets.push_back( SplitNALUnits( Stream.AccessUnits[0], 8 ).at( 0 ) );
    VLogCapture Log( "H264IO" );
    const VDecode ParameterSets( JoinNALUnits( Sets, false ), ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_FALSE( ParameterSets.bDecoded || ParameterSets.pOutput );
    EXPECT_TRUE( Log.Has( "Could not decode frame. Buffer status was 0, not 1." ) );
    const std::size_t LinesBefore = Log.Messages.size();
    const VDecode Garbage( { 0, 0, 0, 1, 0x65, 0xFF, 0x13, 0x00, 0x42, 0x99, 0, 0, 1, 0x41, 0x9A },
                           ZOL::PixelFormat_U8Y8V8Y8 );
    EXPECT_FALSE( Garbage.bDecoded || Garbage.pOutput );
    EXPECT_GT( Log.Messages.size(), LinesBefore );
  }

  // 80 frames, a key frame every 30: key frames at 0, 30 and 60. The video source reaches any
  // frame by decoding forward from the key frame before it.
  TEST_F( H264Decoder, TheVideoSourceGivesFfmpegsFramesWhereverItGoes )
  {
    const VH264Stream Stream = MakeH264Stream( 96, 64, 80, 30 );
    const std::vector< VBytes > Expected = ExpectedUYVYFrames( Stream );
    ASSERT_EQ( Stream.AccessUnits.size(), 80u );
    ASSERT_EQ( Expected.size(), 80u );
    std::unique_ptr< VVideoSource > pSource;
    auto Open = [&]( const VH264Stream& i_rStream, const std::vector< std::uint64_t >& i_rNumbers = {} )
    {
      auto pReader = std::make_shared< VMemoryH264Reader >( i_rStream, i_rNumbers );
      pSource = std::make_unique< VVideoSource >();
      EXPECT_TRUE( pSource->Open( "memory.h264", pReader ) );
      return pReader;
    };
    auto FrameIs = [&]( std::uint64_t i_Index, std::size_t i_Expected )
    {
      ZOL::IVideoFrame Frame;
      if( !pSource->GetFrame( i_Index, Frame ) || !Frame.Video )
        return ::testing::AssertionFailure() << "frame " << i_Index << " did not decode";
      if( Bytes( *Frame.Video ) != Expected[i_Expected] )
        return ::testing::AssertionFailure() << "frame " << i_Index << " differs from ffmpeg's";
      return ::testing::AssertionSuccess();
    };

    // Alone mid-group, around a key frame and at the end; backwards; forward within a group;
    // across groups.
    for( const char* pJump :
         { "45", "29", "30", "31", "79", "62 61 60 59 31 30 29 1 0", "3 17 18 28", "5 70 33 34 35 2" } )
    {
      Open( Stream );
      std::istringstream Jump( pJump );
      for( std::uint64_t Index = 0; Jump >> Index; )
        EXPECT_TRUE( FrameIs( Index, Index ) ) << "jumping " << pJump;
    }

    // Stored under numbers with holes after 9 and 49, frames still follow each other in
    // decoding order, so nothing is decoded twice. The first frame is read once more, to see
    // that it is a key frame.
    std::vector< std::uint64_t > Holes;
    for( std::uint64_t i = 0; i < 80; ++i )
      Holes.push_back( i + ( i >= 10 ? 5 : 0 ) + ( i >= 50 ? 100 : 0 ) );
    for( const std::vector< std::uint64_t >& rNumbers : { std::vector< std::uint64_t >(), Holes } )
    {
      const auto pReader = Open( Stream, rNumbers );
      for( std::uint64_t i = 0; i < 80; ++i )
        ASSERT_TRUE( FrameIs( rNumbers.empty() ? i : rNumbers[i], i ) );
      EXPECT_EQ( pReader->Reads, 81u );
    }
    // A jump into the second hole's far side still finds the key frame before it.
    Open( Stream, Holes );
    EXPECT_TRUE( FrameIs( Holes[55], 55 ) );

    // The first ten frames are gone: 0 to 19 of the rest lack their references, 20 (the
    // original 30) is a key frame and everything from there matches.
    VH264Stream Cut = Stream;
    Cut.AccessUnits.erase( Cut.AccessUnits.begin(), Cut.AccessUnits.begin() + 10 );
    Open( Cut );
    ZOL::IVideoFrame Frame;
    EXPECT_FALSE( pSource->GetFrame( 5, Frame ) );
    EXPECT_TRUE( FrameIs( 21, 31 ) );
    EXPECT_TRUE( FrameIs( 20, 30 ) );
    for( std::uint64_t i = 21; i < 70; ++i )
      ASSERT_TRUE( FrameIs( i, i + 10 ) );

    // A key frame, then far more frames without one than a scrub walks back over: the walk
    // stops without decoding the copies.
    Cut.AccessUnits.assign( 1, Stream.AccessUnits[0] );
    Cut.AccessUnits.insert( Cut.AccessUnits.end(), 1500, Stream.AccessUnits[1] );
    const auto pReader = Open( Cut );
    VLogCapture Log( "H264IO" );
    EXPECT_FALSE( pSource->GetFrame( 1400, Frame ) );
    EXPECT_TRUE( Log.Has( "No key frame within 1200 frames before frame 1400." ) );
    EXPECT_EQ( pReader->Reads, 1200u );
    EXPECT_TRUE( FrameIs( 0, 0 ) );
    EXPECT_TRUE( FrameIs( 1, 1 ) );
  }
} // namespace
