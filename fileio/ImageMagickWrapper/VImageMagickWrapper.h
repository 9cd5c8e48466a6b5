#pragma once

// MagickWand, opened by name at run time with every entry point resolved up front. When the
// library or one of its entry points is missing, the wrapper says so once in the log and
// counts as not available; the readers then answer false and the rest of the viewer is
// unaffected.

#include <cstddef>
#include <string>
#include <sys/types.h>

namespace ImageMagickWrapper
{
  // The library's own types, of which only pointers and these few values pass through here.
  struct VMagickWand;
  struct VMagickImage;
  struct VMagickExceptionInfo;
  using MagickBoolean = int; // MagickBooleanType: MagickFalse 0, MagickTrue 1

  // MagickCore's ImageType values the readers accept, and StorageType's 8-bit samples.
  constexpr int GrayscaleType = 2;
  constexpr int PaletteType = 4;
  constexpr int TrueColorType = 6;
  constexpr int CharPixel = 1;

  // The distribution's MagickWand of ImageMagick 6 at 16-bit quantum depth.
  constexpr const char* DefaultLibraryName = "libMagickWand-6.Q16.so.6";
  // Names another library file in place of the default (a test runs without the library by
  // naming one that does not exist).
  constexpr const char* LibraryNameVariable = "LUMEK_MAGICKWAND_LIBRARY";

  class VImageMagickWrapper
  {
  public:
    explicit VImageMagickWrapper( const std::string& i_rLibraryName );
    ~VImageMagickWrapper();
    VImageMagickWrapper( const VImageMagickWrapper& ) = delete;
    VImageMagickWrapper& operator=( const VImageMagickWrapper& ) = delete;

    bool IsAvailable() const { return m_bAvailable; }

    void ( *MagickWandGenesis )() = nullptr;
    void ( *MagickWandTerminus )() = nullptr;
    VMagickWand* ( *NewMagickWand )() = nullptr;
    VMagickWand* ( *DestroyMagickWand )( VMagickWand* ) = nullptr;
    void ( *ClearMagickWand )( VMagickWand* ) = nullptr;
    MagickBoolean ( *MagickSetFilename )( VMagickWand*, const char* ) = nullptr;
    MagickBoolean ( *MagickPingImageBlob )( VMagickWand*, const void*, std::size_t ) = nullptr;
    MagickBoolean ( *MagickReadImageBlob )( VMagickWand*, const void*, std::size_t ) = nullptr;
    std::size_t ( *MagickGetImageWidth )( VMagickWand* ) = nullptr;
    std::size_t ( *MagickGetImageHeight )( VMagickWand* ) = nullptr;
    char* ( *MagickGetException )( const VMagickWand*, int* ) = nullptr;
    void* ( *MagickRelinquishMemory )( void* ) = nullptr;
    MagickBoolean ( *MagickExportImagePixels )( VMagickWand*, ssize_t, ssize_t, std::size_t, std::size_t, const char*,
                                                int, void* ) = nullptr;
    // MagickWand 6 has no call that scans the pixels for the image's type; MagickCore's
    // IdentifyImageType does, on the wand's current image.
    VMagickImage* ( *GetImageFromMagickWand )( const VMagickWand* ) = nullptr;
    VMagickExceptionInfo* ( *AcquireExceptionInfo )() = nullptr;
    VMagickExceptionInfo* ( *DestroyExceptionInfo )( VMagickExceptionInfo* ) = nullptr;
    int ( *IdentifyImageType )( const VMagickImage*, VMagickExceptionInfo* ) = nullptr;

  private:
    void* m_pModule = nullptr;
    bool m_bAvailable = false;
  };

  // The process-wide wrapper, opened at its first use, by the name LibraryNameVariable gives
  // when it is set and DefaultLibraryName otherwise.
  const VImageMagickWrapper& SharedWrapper();
} // namespace ImageMagickWrapper
