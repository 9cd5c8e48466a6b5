#include "fileio/ImageMagickWrapper/ImageReader.h"

#include "services/Log.h"

namespace ImageMagickWrapper
{
  namespace
  {
    // The category is the reader's, known only at run time, so it is looked up per message;
    // only failures log here.
    template < typename... Args >
    void LogFailure( const VImageKind& i_rKind, int i_Line, const char* i_pFormat, const Args&... i_rArgs )
    {
      const ZOL::ILogCategory& rCategory = ZOL::GlobalLog().GetCategory( i_rKind.pLogCategory );
      if( rCategory.Enabled( ZOL::LogFailure ) )
        ZOL::LogFormatted( rCategory, ZOL::LogFailure, __FILE__, i_Line, i_pFormat, i_rArgs... );
    }

    // The wand, destroyed on every way out.
    class VWand
    {
    public:
      explicit VWand( const VImageMagickWrapper& i_rWrapper )
          : m_rWrapper( i_rWrapper ), m_pWand( i_rWrapper.NewMagickWand() )
      {
      }
      ~VWand()
      {
        if( m_pWand != nullptr )
          m_rWrapper.DestroyMagickWand( m_pWand );
      }
      VWand( const VWand& ) = delete;
      VWand& operator=( const VWand& ) = delete;
      VMagickWand* Get() const { return m_pWand; }

    private:
      const VImageMagickWrapper& m_rWrapper;
      VMagickWand* m_pWand;
    };

    void ReportException( const VImageMagickWrapper& i_rWrapper, const VImageKind& i_rKind, VMagickWand* i_pWand )
    {
      int Severity = 0;
      char* pText = i_rWrapper.MagickGetException( i_pWand, &Severity );
      // Some failures of the coders leave no text behind; the line still says which library.
      const bool bHasText = pText != nullptr && *pText != '\0';
      LogFailure( i_rKind, __LINE__, "ImageMagick exception: %s", bHasText ? pText : "(no description)" );
      if( pText != nullptr )
        i_rWrapper.MagickRelinquishMemory( pText );
    }

    int IdentifyType( const VImageMagickWrapper& i_rWrapper, VMagickWand* i_pWand )
    {
      const VMagickImage* pImage = i_rWrapper.GetImageFromMagickWand( i_pWand );
      VMagickExceptionInfo* pException = i_rWrapper.AcquireExceptionInfo();
      if( pImage == nullptr || pException == nullptr )
      {
        if( pException != nullptr )
          i_rWrapper.DestroyExceptionInfo( pException );
        return 0;
      }
      const int Type = i_rWrapper.IdentifyImageType( pImage, pException );
      i_rWrapper.DestroyExceptionInfo( pException );
      return Type;
    }

    // Reads the image's size without its pixels, so that a header that claims a huge image
    // is refused before the library allocates for it.
    bool CheckSize( const VImageMagickWrapper& i_rWrapper, const VImageKind& i_rKind, VMagickWand* i_pWand,
                    const ZOL::IVideoFrameInfo& i_rInfo, std::uint64_t i_TargetSize )
    {
      const std::uint64_t Width = i_rWrapper.MagickGetImageWidth( i_pWand );
      const std::uint64_t Height = i_rWrapper.MagickGetImageHeight( i_pWand );
      const bool bDeclared = i_rInfo.ImageWidth > 0 || i_rInfo.ImageHeight > 0;
      if( bDeclared && ( Width != static_cast< std::uint64_t >( i_rInfo.ImageWidth ) ||
                         Height != static_cast< std::uint64_t >( i_rInfo.ImageHeight ) ) )
      {
        LogFailure( i_rKind, __LINE__, "Image of %d x %d does not match the frame of %d x %d.", Width, Height,
                    i_rInfo.ImageWidth, i_rInfo.ImageHeight );
        return false;
      }
      // At least one byte a pixel; the exact need is checked once the type is known.
      if( Width == 0 || Height == 0 || Width > INT32_MAX || Height > INT32_MAX || Width > i_TargetSize ||
          Height > i_TargetSize / Width )
      {
        LogFailure( i_rKind, __LINE__, "Image of %d x %d does not fit a frame buffer of %d bytes.", Width, Height,
                    i_TargetSize );
        return false;
      }
      return true;
    }

    bool ReadInto( const VImageMagickWrapper& i_rWrapper, const VImageKind& i_rKind, VMagickWand* i_pWand,
                   const std::uint8_t* i_pData, std::uint64_t i_Size, bool i_bPing )
    {
      // The forced coder applies to the next read only; a cleared wand has forgotten it.
      i_rWrapper.MagickSetFilename( i_pWand, i_rKind.pCoderPrefix );
      const auto Read = i_bPing ? i_rWrapper.MagickPingImageBlob : i_rWrapper.MagickReadImageBlob;
      if( Read( i_pWand, i_pData, static_cast< std::size_t >( i_Size ) ) != 1 )
      {
        ReportException( i_rWrapper, i_rKind, i_pWand );
        return false;
      }
      return true;
    }
  } // namespace

  bool ReadImage( const VImageMagickWrapper& i_rWrapper, const VImageKind& i_rKind, const std::uint8_t* i_pData,
                  std::uint64_t i_Size, ZOL::IVideoFrameInfo& io_VideoFrameInfo, std::uint8_t* o_pTarget,
                  std::uint64_t i_TargetSize )
  {
    // Without the library every read is simply no frame; its absence was logged when it was
    // looked for.
    if( !i_rWrapper.IsAvailable() )
      return false;
    const VWand Wand( i_rWrapper );
    if( Wand.Get() == nullptr || i_pData == nullptr || i_Size == 0 || o_pTarget == nullptr )
      return false;
    if( !ReadInto( i_rWrapper, i_rKind, Wand.Get(), i_pData, i_Size, true ) ||
        !CheckSize( i_rWrapper, i_rKind, Wand.Get(), io_VideoFrameInfo, i_TargetSize ) )
      return false;
    i_rWrapper.ClearMagickWand( Wand.Get() );
    if( !ReadInto( i_rWrapper, i_rKind, Wand.Get(), i_pData, i_Size, false ) ||
        !CheckSize( i_rWrapper, i_rKind, Wand.Get(), io_VideoFrameInfo, i_TargetSize ) )
      return false;

    const std::uint64_t Width = i_rWrapper.MagickGetImageWidth( Wand.Get() );
    const std::uint64_t Height = i_rWrapper.MagickGetImageHeight( Wand.Get() );
    const int Type = IdentifyType( i_rWrapper, Wand.Get() );
    const bool bGrey = Type == GrayscaleType;
    if( !bGrey && Type != PaletteType && Type != TrueColorType )
    {
      LogFailure( i_rKind, __LINE__, "Unsupported format" );
      return false;
    }
    const std::uint64_t Channels = bGrey ? 1 : 3;
    if( Width * Height * Channels > i_TargetSize )
    {
      LogFailure( i_rKind, __LINE__, "Image of %d x %d does not fit a frame buffer of %d bytes.", Width, Height,
                  i_TargetSize );
      return false;
    }
    if( i_rWrapper.MagickExportImagePixels( Wand.Get(), 0, 0, Width, Height, bGrey ? "I" : "RGB", CharPixel,
                                            o_pTarget ) != 1 )
    {
      ReportException( i_rWrapper, i_rKind, Wand.Get() );
      return false;
    }
    io_VideoFrameInfo.ImageWidth = static_cast< std::int32_t >( Width );
    io_VideoFrameInfo.ImageHeight = static_cast< std::int32_t >( Height );
    io_VideoFrameInfo.PixelFormat = bGrey ? ZOL::PixelFormat_Luminance8 : ZOL::PixelFormat_R8G8B8;
    return true;
  }
} // namespace ImageMagickWrapper
