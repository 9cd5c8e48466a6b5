#include "graphics/CoreVideoUtils/PixelFormatConverter.h"

#include "graphics/CoreVideoUtils/FormatRuns.h"
#include "graphics/CoreVideoUtils/PixelKernels.h"
#include "services/DebugServices.h"
#include "services/Log.h"
#include "videointerface/BufferAllocators.h"
#include "videointerface/PixelFormatDescriptor.h"

#include <algorithm>
#include <cstring>

namespace CoreVideoUtils
{
  namespace
  {
    using namespace ZOL;

    // Runs of this many pixels go through the intermediate forms: small enough to stay in the
    // first-level cache, a multiple of 48 and of 8 (see FormatRuns.h).
    constexpr std::uint32_t RunLength = 4608;

    bool IsOneOf( EPixelFormat i_Format, std::initializer_list< EPixelFormat > i_Formats )
    {
      return std::find( i_Formats.begin(), i_Formats.end(), i_Format ) != i_Formats.end();
    }

    // 10-bit YUV pairs a pixel's chroma with its neighbour's, so a frame needs whole pairs.
    bool HasWholePairs( std::int64_t i_Width, std::int64_t i_Height )
    {
      return LUMEK_ASSERT( ( ( i_Width * i_Height ) % 2 ) == 0 );
    }

    Runs::VFrame MakeFrame( const std::uint8_t* i_pData, std::uint64_t i_Size, std::uint32_t i_Width,
                            std::uint32_t i_Height )
    {
      // Readers never write through the pointer; one record type serves both sides.
      return { const_cast< std::uint8_t* >( i_pData ), i_Size, i_Width, i_Height,
               static_cast< std::uint64_t >( i_Width ) * i_Height };
    }
  } // namespace

  std::uint64_t FrameSizeInBytes( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_Format )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_Format;
    return ZOL::GetVideoFrameSizeInBytes64( Info );
  }

  VPixelFormatConverter::VPixelFormatConverter( std::shared_ptr< ZOL::IBufferAllocator > i_pAllocator,
                                                std::shared_ptr< VColourCorrector > i_pColourCorrector )
      : m_pColourCorrector( i_pColourCorrector ? std::move( i_pColourCorrector )
                                               : std::make_shared< VColourCorrector >() ),
        m_pAllocator( i_pAllocator ? std::move( i_pAllocator ) : std::make_shared< ZOL::VFrameBufferAllocator >() ),
        m_InstructionSet( BestInstructionSet() )
  {
  }

  void VPixelFormatConverter::SetVideoSettings( const ZOL::IVideoSettings& i_rVideoSettings )
  {
    m_pColourCorrector->Set( i_rVideoSettings );
  }

  void VPixelFormatConverter::SetLensDistortionCalibration( const CoreLumekTypes::VCameraHardware&,
                                                            const CoreLumekTypes::VLensDistortionCalibration& )
  {
    LUMEK_LOG( "CoreVideoUtils", ZOL::LogWarning, "Lens distortion correction not supported in software converter." );
  }

  void VPixelFormatConverter::SetLensDistortionCorrectionEnabled( bool i_bEnabled )
  {
    if( i_bEnabled )
      LUMEK_LOG( "CoreVideoUtils", ZOL::LogWarning, "Lens distortion correction not supported in software converter." );
  }

  std::shared_ptr< ZOL::IBuffer > VPixelFormatConverter::Allocate( std::uint64_t i_Size )
  {
    std::shared_ptr< ZOL::IBuffer > pBuffer;
    m_pAllocator->Allocate( pBuffer, i_Size );
    return pBuffer;
  }

  bool VPixelFormatConverter::Convert( const ZOL::IVideoFrameInfo& i_rVideoFrameInfo, const std::uint8_t* i_pSource,
                                       std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                                       std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    const std::int32_t Width = i_rVideoFrameInfo.ImageWidth, Height = i_rVideoFrameInfo.ImageHeight;
    const EPixelFormat SourceFormat = i_rVideoFrameInfo.PixelFormat;
    const std::uint64_t SourceBytes = FrameSizeInBytes( Width, Height, SourceFormat );
    const std::uint64_t TargetBytes = FrameSizeInBytes( Width, Height, i_TargetFormat );
    if( SourceBytes == 0 || TargetBytes == 0 || i_pSource == nullptr || o_pTarget == nullptr ||
        i_SourceSize < SourceBytes || i_TargetSize < TargetBytes )
      return false;
    if( SourceFormat == i_TargetFormat )
    {
      std::memcpy( o_pTarget, i_pSource, SourceBytes );
      return true;
    }
    const std::uint32_t W = static_cast< std::uint32_t >( Width ), H = static_cast< std::uint32_t >( Height );
    if( IsBayerFormat( SourceFormat ) )
      return ConvertBayer( W, H, SourceFormat, i_pSource, SourceBytes, i_TargetFormat, o_pTarget, TargetBytes );
    return ConvertRuns( W, H, SourceFormat, i_pSource, SourceBytes, i_TargetFormat, o_pTarget, TargetBytes );
  }

  bool VPixelFormatConverter::ConvertBayer( std::uint32_t i_Width, std::uint32_t i_Height,
                                            ZOL::EPixelFormat i_SourceFormat, const std::uint8_t* i_pSource,
                                            std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                                            std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    const std::uint64_t Pixels = static_cast< std::uint64_t >( i_Width ) * i_Height;
    const VPixelFormatDescriptor& rSource = DescribePixelFormat( i_SourceFormat );
    const VPixelFormatDescriptor& rTarget = DescribePixelFormat( i_TargetFormat );
    const bool bSourcePacked = rSource.Packing == EPixelPacking::PackedBits;
    if( rTarget.Family == EPixelFamily::Bayer )
    {
      // Between Bayer formats only the packing changes; the mosaic never moves.
      const bool bTargetPacked = rTarget.Packing == EPixelPacking::PackedBits;
      if( rSource.Phase != rTarget.Phase || bSourcePacked == bTargetPacked )
        return false;
      if( bSourcePacked )
        Kernels::UnpackSamples( i_pSource, i_SourceSize, rSource.BitsPerSample, 0, Pixels, o_pTarget );
      else
        Kernels::PackSamples( i_pSource, rTarget.BitsPerSample, 0, Pixels, o_pTarget, i_TargetSize );
      return true;
    }
    if( !IsOneOf( i_TargetFormat, { PixelFormat_Luminance8, PixelFormat_R8G8B8, PixelFormat_B8G8R8,
                                    PixelFormat_R8G8B8u8, PixelFormat_B8G8R8u8, PixelFormat_U8Y8V8Y8,
                                    PixelFormat_Y8U8Y8V8, PixelFormat_PlanarY8U8V8, PixelFormat_PlanarR8G8B8 } ) )
      return false;
    if( bSourcePacked )
    {
      std::shared_ptr< ZOL::IBuffer > pBayer = Allocate( Pixels );
      if( !pBayer )
        return false;
      Kernels::UnpackSamples( i_pSource, i_SourceSize, rSource.BitsPerSample, 0, Pixels, pBayer->GetData() );
      return Demosaic( i_Width, i_Height, BayerStartKind( i_SourceFormat ), pBayer->GetData(), i_TargetFormat,
                       o_pTarget, i_TargetSize );
    }
    return Demosaic( i_Width, i_Height, BayerStartKind( i_SourceFormat ), i_pSource, i_TargetFormat, o_pTarget,
                     i_TargetSize );
  }

  bool VPixelFormatConverter::Demosaic( std::uint32_t i_Width, std::uint32_t i_Height, unsigned i_StartKind,
                                        const std::uint8_t* i_pSource, ZOL::EPixelFormat i_TargetFormat,
                                        std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    const std::uint64_t W = i_Width;
    const bool bDirect = i_TargetFormat == PixelFormat_R8G8B8 || i_TargetFormat == PixelFormat_B8G8R8;
    // One buffer: a row of zeros for the rows beyond the picture, then the row scratch.
    std::shared_ptr< ZOL::IBuffer > pScratch = Allocate( W + ( bDirect ? 0 : 5 * W ) );
    if( !pScratch )
      return false;
    std::uint8_t* pZero = pScratch->GetData();
    std::uint8_t* pRowRGB = pZero + W;
    std::uint8_t* pRowChroma = pRowRGB + 3 * W;
    std::memset( pZero, 0, W );

    const VColourCorrector& rCorrector = *m_pColourCorrector;
    const bool bCorrect = IsInterleavedRGB( i_TargetFormat ) && !rCorrector.IsIdentity();
    const std::uint8_t* pTable = rCorrector.GetGamma() != 1.0f ? rCorrector.GetTable().data() : nullptr;
    const Runs::VFrame Target = MakeFrame( o_pTarget, i_TargetSize, i_Width, i_Height );
    const Runs::VTargetRuns& rTargetRuns = Runs::TargetRuns( i_TargetFormat );
    const Runs::ReadRun RGBToLuminance = Runs::SourceRuns( PixelFormat_R8G8B8 ).ToLuminance;

    for( std::uint32_t y = 0; y < i_Height; ++y )
    {
      const std::uint8_t* pRow = i_pSource + y * W;
      const std::uint8_t* pNorth = y > 0 ? pRow - W : pZero;
      const std::uint8_t* pSouth = y + 1 < i_Height ? pRow + W : pZero;
      const unsigned Kind = i_StartKind ^ ( ( y & 1u ) != 0 ? 3u : 0u );
      const std::uint64_t First = y * W;
      std::uint8_t* pRGB = bDirect ? o_pTarget + 3 * First : pRowRGB;
      Kernels::DemosaicRow( pNorth, pRow, pSouth, i_Width, Kind, i_TargetFormat == PixelFormat_B8G8R8, pRGB,
                            m_InstructionSet );
      // Correcting the row while it is in the cache gives the bytes of correcting the frame after.
      if( bCorrect )
        Kernels::CorrectColours( pRGB, W, 3, pTable, rCorrector.GetSaturationDelta(), m_InstructionSet );
      if( bDirect )
        continue;
      switch( rTargetRuns.Form )
      {
      case Runs::ERunForm::Luminance:
        RGBToLuminance( MakeFrame( pRowRGB, 3 * W, i_Width, 1 ), 0, i_Width, o_pTarget + First, m_InstructionSet );
        break;
      case Runs::ERunForm::Chroma:
        Runs::RGBToChroma( pRowRGB, i_Width, First & 1u, rTargetRuns.Write ? pRowChroma : o_pTarget + 2 * First );
        if( rTargetRuns.Write )
          rTargetRuns.Write( pRowChroma, First, i_Width, Target );
        break;
      default:
        rTargetRuns.Write( pRowRGB, First, i_Width, Target );
        break;
      }
    }
    return true;
  }

  bool VPixelFormatConverter::ConvertRuns( std::uint32_t i_Width, std::uint32_t i_Height,
                                           ZOL::EPixelFormat i_SourceFormat, const std::uint8_t* i_pSource,
                                           std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                                           std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    // Planar YUV, which only the JPEG reader gives, is taken to the formats that can show it.
    if( i_SourceFormat == PixelFormat_PlanarY8U8V8 &&
        !IsOneOf( i_TargetFormat, { PixelFormat_R8G8B8u8, PixelFormat_B8G8R8u8, PixelFormat_U10Y10V10Y10 } ) )
      return false;
    const Runs::VSourceRuns& rSource = Runs::SourceRuns( i_SourceFormat );
    const Runs::VTargetRuns& rTarget = Runs::TargetRuns( i_TargetFormat );
    Runs::ReadRun Read = nullptr;
    bool bThroughRGB = false;
    unsigned DirectBytes = 0;
    switch( rTarget.Form )
    {
    case Runs::ERunForm::Luminance:
      Read = rSource.ToLuminance, DirectBytes = 1;
      break;
    case Runs::ERunForm::RGB:
      Read = rSource.ToRGB, DirectBytes = 3;
      if( i_SourceFormat == PixelFormat_U10Y10V10Y10 && !HasWholePairs( i_Width, i_Height ) )
        return false;
      break;
    case Runs::ERunForm::Chroma:
      Read = rSource.ToChroma, DirectBytes = 2;
      if( Read == nullptr )
        Read = rSource.ToRGB, bThroughRGB = true;
      break;
    case Runs::ERunForm::None:
      break;
    }
    if( Read == nullptr )
      return false;

    std::shared_ptr< ZOL::IBuffer > pScratch;
    if( rTarget.Write || bThroughRGB )
    {
      pScratch = Allocate( 5ull * RunLength );
      if( !pScratch )
        return false;
    }
    std::uint8_t* pRunRGB = pScratch ? pScratch->GetData() : nullptr;
    std::uint8_t* pRun = pScratch ? pRunRGB + 3 * RunLength : nullptr;
    if( rTarget.Form == Runs::ERunForm::RGB )
      pRun = pRunRGB;

    const Runs::VFrame Source = MakeFrame( i_pSource, i_SourceSize, i_Width, i_Height );
    const Runs::VFrame Target = MakeFrame( o_pTarget, i_TargetSize, i_Width, i_Height );
    // Rows matter only to the padded 10-bit format; all others are one run of pixels.
    const bool bByRow = i_SourceFormat == PixelFormat_U10Y10V10Y10 || i_TargetFormat == PixelFormat_U10Y10V10Y10;
    const std::uint64_t RowLength = bByRow ? i_Width : Source.Pixels;
    const std::uint64_t Rows = bByRow ? i_Height : 1;
    for( std::uint64_t Row = 0; Row < Rows; ++Row )
      for( std::uint64_t x = 0; x < RowLength; x += RunLength )
      {
        const std::uint32_t Count =
            static_cast< std::uint32_t >( std::min< std::uint64_t >( RunLength, RowLength - x ) );
        const std::uint64_t First = Row * RowLength + x;
        std::uint8_t* pOut = rTarget.Write ? pRun : o_pTarget + DirectBytes * First;
        if( bThroughRGB )
        {
          // Runs start at even pixels of their row, so the first pixel of a run takes U.
          Read( Source, First, Count, pRunRGB, m_InstructionSet );
          Runs::RGBToChroma( pRunRGB, Count, 0, pOut );
        }
        else
          Read( Source, First, Count, pOut, m_InstructionSet );
        if( rTarget.Write )
          rTarget.Write( pOut, First, Count, Target );
      }
    return true;
  }

  bool ConvertFrame( std::int32_t i_Width, std::int32_t i_Height, ZOL::EPixelFormat i_SourceFormat,
                     const std::uint8_t* i_pSource, std::uint64_t i_SourceSize, ZOL::EPixelFormat i_TargetFormat,
                     std::uint8_t* o_pTarget, std::uint64_t i_TargetSize )
  {
    ZOL::IVideoFrameInfo Info;
    Info.ImageWidth = i_Width;
    Info.ImageHeight = i_Height;
    Info.PixelFormat = i_SourceFormat;
    VPixelFormatConverter Converter;
    return Converter.Convert( Info, i_pSource, i_SourceSize, i_TargetFormat, o_pTarget, i_TargetSize );
  }
} // namespace CoreVideoUtils
