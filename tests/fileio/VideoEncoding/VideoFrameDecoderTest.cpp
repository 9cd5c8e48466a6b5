// What the frame decoder makes of each payload: raw frames used where they lie when they hold
// their description, H.264 through the decoder it is given, still images checked by their
// signature before anything is allocated for them; and the pixel format it announces for each.

#include "fileio/VideoEncoding/VideoFrameDecoder.h"

#include "tests/support/LogCapture.h"
#include "videointerface/BufferAllocators.h"

#include <gtest/gtest.h>

#include <cstring>
#include <fstream>
#include <iterator>
#include <sstream>
#include <string>
#include <tuple>
#include <vector>

namespace
{
  using namespace ZOL;

  IVideoFrameInfo Info( std::int32_t i_Width, std::int32_t i_Height, EPixelFormat i_Format )
  {
    IVideoFrameInfo Result;
    Result.ImageWidth = i_Width;
    Result.ImageHeight = i_Height;
    Result.PixelFormat = i_Format;
    return Result;
  }

  class FrameDecoder : public ::testing::Test
  {
  protected:
    std::shared_ptr< IBuffer > Payload( const std::vector< std::uint8_t >& i_rBytes )
    {
      std::shared_ptr< IBuffer > pBuffer;
      m_pReaderAllocator->Allocate( pBuffer, i_rBytes.size() );
      if( !i_rBytes.empty() )
        std::memcpy( pBuffer->GetData(), i_rBytes.data(), i_rBytes.size() );
      return pBuffer;
    }

    bool Decode( EVideoPayload i_Payload, IVideoFrameInfo& io_rInfo, std::shared_ptr< IBuffer >& io_rBuffer,
                 const std::shared_ptr< IH264Decoder >& i_pH264 = nullptr )
    {
      return VideoEncoding::VideoFrameDecoder( i_Payload, io_rInfo, io_rBuffer, m_pFrameAllocator,
                                               m_pTemporaryAllocator, i_pH264 );
    }

    std::shared_ptr< IBufferAllocator > m_pReaderAllocator = std::make_shared< VReaderBufferAllocator >();
    std::shared_ptr< IBufferAllocator > m_pFrameAllocator = std::make_shared< VFrameBufferAllocator >();
    std::shared_ptr< IBufferAllocator > m_pTemporaryAllocator = std::make_shared< VFrameBufferAllocator >();
  };

  // A raw frame is used where it lies, so a description that promises more bytes than the
  // buffer holds would have the surface read past its end: it is refused.
  TEST_F( FrameDecoder, UncompressedKeepsTheVeryBufferWhenItHoldsItsDescription )
  {
    const std::tuple< IVideoFrameInfo, std::size_t, bool > Cases[] = {
        { Info( 4, 3, PixelFormat_B8G8R8 ), 36, true },
        { Info( 4, 3, PixelFormat_R8G8B8 ), 35, false },
        { Info( 64, 2, PixelFormat_U10Y10V10Y10 ), 2 * 128 * 2 - 1, false },
        { Info( 9, 1, PixelFormat_Luminance7 ), 7, false },
        { Info( 4, 3, PixelFormat_Unspecified ), 100, false },
        { Info( 0x7FFFFFFF, 0x7FFFFFFF, PixelFormat_R8G8B8u8 ), 100, false },
        { Info( -4, 3, PixelFormat_Luminance8 ), 100, false },
    };
    for( const auto& [rFrameInfo, Bytes, bHolds] : Cases )
    {
      SCOPED_TRACE( std::to_string( Bytes ) + " bytes" );
      LumekTest::VLogCapture Log( "VideoEncoding" );
      auto pBuffer = Payload( std::vector< std::uint8_t >( Bytes ) );
      IBuffer* pBefore = pBuffer.get();
      IVideoFrameInfo FrameInfo = rFrameInfo;
      EXPECT_EQ( Decode( VideoPayload_Uncompressed, FrameInfo, pBuffer ), bHolds );
      EXPECT_EQ( pBuffer.get(), pBefore );
      EXPECT_EQ( FrameInfo, rFrameInfo );
      EXPECT_EQ( Log.Lines().size(), bHolds ? 0u : 1u );
      if( Bytes == 35 )
      {
        EXPECT_EQ( Log.Lines().at( 0 ), "2 Uncompressed frame of 35 bytes does not hold a 4 x 3 frame of pixel format "
                                        "'R8G8B8' (36 bytes)." );
      }
      // No buffer is no frame, whatever the payload.
      std::shared_ptr< IBuffer > pNone;
      for( EVideoPayload Payload : { VideoPayload_Uncompressed, VideoPayload_ImageJPEG, VideoPayload_VideoH264 } )
        EXPECT_FALSE( Decode( Payload, FrameInfo, pNone ) );
    }
  }

  // A stand-in decoder: notes what it is given and answers as told.
  struct VFakeH264Decoder : IH264Decoder
  {
    bool Decode( const IBufferConst& i_rInput, EPixelFormat i_PixelFormat, std::shared_ptr< IBuffer >& o_rOutput,
                 IVideoFrameInfo& io_VideoFrameInfo ) override
    {
      InputSize = i_rInput.GetSize();
      Wished = i_PixelFormat;
      if( pPicture )
      {
        io_VideoFrameInfo = Info( 2, 2, PixelFormat_U8Y8V8Y8 );
        o_rOutput = pPicture;
      }
      return bSucceed;
    }
    bool bSucceed = false;
    std::shared_ptr< IBuffer > pPicture; // given out when there is one
    std::uint64_t InputSize = 0;
    EPixelFormat Wished = PixelFormat_Unspecified;
  };

  TEST_F( FrameDecoder, H264GoesThroughTheDecoder )
  {
    // Without a decoder every frame says so, and the stored bytes stay.
    LumekTest::VLogCapture Log( "VideoEncoding" );
    auto pStored = Payload( { 0, 0, 0, 1, 0x65 } );
    IBuffer* pBefore = pStored.get();
    IVideoFrameInfo Stored = Info( 16, 16, PixelFormat_U8Y8V8Y8 );
    EXPECT_FALSE( Decode( VideoPayload_VideoH264, Stored, pStored ) );
    EXPECT_FALSE( Decode( VideoPayload_VideoH264, Stored, pStored ) );
    EXPECT_EQ( pStored.get(), pBefore );
    EXPECT_EQ( Log.Lines(),
               std::vector< std::string >( 2, "2 H.264 video for decoding but no H.264 decoder provided." ) );
    // Only success with a picture is a frame. The stored bytes are released either way; what the
    // decoder gave, if anything, is kept.
    for( const bool bSucceed : { true, false } )
      for( const bool bGiveFrame : { true, false } )
      {
        SCOPED_TRACE( std::string( bSucceed ? "succeeds" : "fails" ) + ( bGiveFrame ? " with" : " without" ) );
        auto pDecoder = std::make_shared< VFakeH264Decoder >();
        pDecoder->bSucceed = bSucceed;
        pDecoder->pPicture = bGiveFrame ? Payload( std::vector< std::uint8_t >( 8 ) ) : nullptr;
        auto pBuffer = Payload( { 0, 0, 0, 1, 0x65, 0x88 } );
        IVideoFrameInfo FrameInfo = Info( 640, 480, PixelFormat_Y8U8Y8V8 );
        EXPECT_EQ( Decode( VideoPayload_VideoH264, FrameInfo, pBuffer, pDecoder ), bSucceed && bGiveFrame );
        EXPECT_EQ( pDecoder->InputSize, 6u );
        EXPECT_EQ( pDecoder->Wished, PixelFormat_Y8U8Y8V8 );
        EXPECT_EQ( pBuffer ? pBuffer->GetSize() : 0u, bGiveFrame ? 8u : 0u );
        EXPECT_EQ( FrameInfo,
                   bGiveFrame ? Info( 2, 2, PixelFormat_U8Y8V8Y8 ) : Info( 640, 480, PixelFormat_Y8U8Y8V8 ) );
      }
  }

  // Payloads that are no image of their kind are missing frames; PNG and TIFF signatures are
  // checked before anything is allocated for them.
  TEST_F( FrameDecoder, StillImagesAreMissingFramesWithTheirSignatureChecked )
  {
    const std::string PNGCheck = "2 PNG frame does not start with the PNG signature.";
    const std::string TIFFCheck = "2 TIFF frame does not start with the little-endian TIFF mark.";
    struct VStillImage
    {
      const char* Name;
      EVideoPayload Payload;
      std::vector< std::uint8_t > Bytes;
      std::string LogLine; // of the failed signature check, if one fails
    };
    const VStillImage Cases[] = {
        { "JPEG", VideoPayload_ImageJPEG, { 0xFF, 0xD8, 0xFF, 0xE0, 0, 0x10 }, "" },
        { "EmptyJPEG", VideoPayload_ImageJPEG, {}, "" },
        { "PNG", VideoPayload_ImagePNG, { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A, 0, 0, 0, 13 }, "" },
        { "PNGWithBadSignature", VideoPayload_ImagePNG, { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0B, 0 }, PNGCheck },
        { "PNGCutInsideSignature", VideoPayload_ImagePNG, { 0x89, 'P', 'N' }, PNGCheck },
        { "EmptyPNG", VideoPayload_ImagePNG, {}, PNGCheck },
        { "LittleEndianTIFF", VideoPayload_ImageTIFF, { 0x49, 0x49, 0x2A, 0x00, 8, 0, 0, 0 }, "" },
        { "BigEndianTIFF", VideoPayload_ImageTIFF, { 0x4D, 0x4D, 0x00, 0x2A, 0, 0, 0, 8 }, TIFFCheck },
        { "TIFFCutInsideSignature", VideoPayload_ImageTIFF, { 0x49, 0x49 }, TIFFCheck },
        { "PayloadNone", VideoPayload_None, { 1, 2, 3 }, "" },
        { "PayloadOutOfRange", static_cast< EVideoPayload >( 6 ), { 1, 2, 3 }, "" },
    };
    for( const VStillImage& rCase : Cases )
    {
      SCOPED_TRACE( rCase.Name );
      LumekTest::VLogCapture Log( "VideoEncoding" );
      auto pBuffer = Payload( rCase.Bytes );
      IVideoFrameInfo FrameInfo = Info( 8, 8, PixelFormat_R8G8B8 );
      EXPECT_FALSE( Decode( rCase.Payload, FrameInfo, pBuffer ) );
      EXPECT_EQ( Log.Lines(),
                 rCase.LogLine.empty() ? std::vector< std::string >() : std::vector< std::string >{ rCase.LogLine } );
    }
  }

  TEST( PixelFormatForPayloadFormat, GoldenTable )
  {
    // One line per payload; the columns are the stored formats 0 to 19, then 20 (no such format).
    // Forcing colour changes JPEG alone.
    std::ostringstream Text;
    for( const bool bForceColour : { false, true } )
    {
      Text << ( bForceColour ? "colour forced\n" : "colour as stored\n" );
      for( int Payload = 0; Payload <= 5; ++Payload )
      {
        Text << ToString( static_cast< EVideoPayload >( Payload ) ) << ":";
        for( int F = 0; F <= 20; ++F )
        {
          EPixelFormat Output = static_cast< EPixelFormat >( 99 );
          EXPECT_TRUE( VideoEncoding::PixelFormatForPayloadFormat(
              static_cast< EVideoPayload >( Payload ), static_cast< EPixelFormat >( F ), Output, bForceColour ) );
          Text << " " << static_cast< int >( Output );
        }
        Text << "\n";
      }
    }
    std::ifstream Golden( VIDEOENCODING_GOLDEN_FOLDER "/payload-pixel-formats.txt" );
    EXPECT_EQ( Text.str(), std::string( std::istreambuf_iterator< char >( Golden ), {} ) );

    // An unknown payload is logged and leaves the output as it was.
    LumekTest::VLogCapture Log( "VideoEncoding" );
    EPixelFormat Output = PixelFormat_B8G8R8;
    EXPECT_FALSE( VideoEncoding::PixelFormatForPayloadFormat( static_cast< EVideoPayload >( 6 ), PixelFormat_Luminance8,
                                                              Output, false ) );
    EXPECT_EQ( Output, PixelFormat_B8G8R8 );
    EXPECT_EQ( Log.Lines(), std::vector< std::string >{ "2 Unsupported video payload format 'Unspecified'." } );
  }
} // namespace
