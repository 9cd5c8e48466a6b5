#include "fileio/ImageMagickWrapper/VImageMagickWrapper.h"

#include "services/Log.h"

#include <atomic>
#include <cstdlib>
#include <dlfcn.h>
#include <mutex>

namespace ImageMagickWrapper
{
  namespace
  {
    // Genesis and terminus are process-wide in the library: only the last wrapper to go may
    // end it, or it would pull the library from under another one.
    std::mutex s_GenesisMutex;
    int s_GenesisCount = 0;

    template < typename TFunction > bool Resolve( void* i_pModule, const char* i_pName, TFunction& o_rFunction )
    {
      o_rFunction = reinterpret_cast< TFunction >( dlsym( i_pModule, i_pName ) );
      if( o_rFunction == nullptr )
        LUMEK_LOG( "ImageMagickWrapper", ZOL::LogInfo, "MagickWand has no entry point %s.", i_pName );
      return o_rFunction != nullptr;
    }
  } // namespace

  VImageMagickWrapper::VImageMagickWrapper( const std::string& i_rLibraryName )
  {
    // The coders are found where the distribution installed them; the library knows that
    // place itself, so no coder path is set here.
    m_pModule = dlopen( i_rLibraryName.c_str(), RTLD_NOW | RTLD_LOCAL );
    if( m_pModule == nullptr )
    {
      const char* pError = dlerror();
      LUMEK_LOG( "ImageMagickWrapper", ZOL::LogFailure, "Could not load MagickWand DLL" );
      LUMEK_LOG( "ImageMagickWrapper", ZOL::LogInfo, "%s", pError != nullptr ? pError : i_rLibraryName );
      return;
    }
    // Every entry point is looked up here, all of them, so that a partial library is found out
    // at once instead of at the first frame that needs the missing one.
    bool bResolved = true;
    bResolved &= Resolve( m_pModule, "MagickWandGenesis", MagickWandGenesis );
    bResolved &= Resolve( m_pModule, "MagickWandTerminus", MagickWandTerminus );
    bResolved &= Resolve( m_pModule, "NewMagickWand", NewMagickWand );
    bResolved &= Resolve( m_pModule, "DestroyMagickWand", DestroyMagickWand );
    bResolved &= Resolve( m_pModule, "ClearMagickWand", ClearMagickWand );
    bResolved &= Resolve( m_pModule, "MagickSetFilename", MagickSetFilename );
    bResolved &= Resolve( m_pModule, "MagickPingImageBlob", MagickPingImageBlob );
    bResolved &= Resolve( m_pModule, "MagickReadImageBlob", MagickReadImageBlob );
    bResolved &= Resolve( m_pModule, "MagickGetImageWidth", MagickGetImageWidth );
    bResolved &= Resolve( m_pModule, "MagickGetImageHeight", MagickGetImageHeight );
    bResolved &= Resolve( m_pModule, "MagickGetException", MagickGetException );
    bResolved &= Resolve( m_pModule, "MagickRelinquishMemory", MagickRelinquishMemory );
    bResolved &= Resolve( m_pModule, "MagickExportImagePixels", MagickExportImagePixels );
    bResolved &= Resolve( m_pModule, "GetImageFromMagickWand", GetImageFromMagickWand );
    bResolved &= Resolve( m_pModule, "AcquireExceptionInfo", AcquireExceptionInfo );
    bResolved &= Resolve( m_pModule, "DestroyExceptionInfo", DestroyExceptionInfo );
    bResolved &= Resolve( m_pModule, "IdentifyImageType", IdentifyImageType );
    if( !bResolved )
    {
      LUMEK_LOG( "ImageMagickWrapper", ZOL::LogFailure, "Could not set up function pointers for ImageMagick library." );
      return;
    }
    {
      const std::lock_guard< std::mutex > Lock( s_GenesisMutex );
      if( s_GenesisCount++ == 0 )
        MagickWandGenesis();
    }
    m_bAvailable = true;
  }

  VImageMagickWrapper::~VImageMagickWrapper()
  {
    if( m_bAvailable )
    {
      const std::lock_guard< std::mutex > Lock( s_GenesisMutex );
      if( --s_GenesisCount == 0 )
        MagickWandTerminus();
    }
    // The module stays mapped: the library's own exit handlers may still run after this.
  }

  const VImageMagickWrapper& SharedWrapper()
  {
    static const VImageMagickWrapper s_Wrapper(
        []
        {
          const char* pName = std::getenv( LibraryNameVariable );
          return std::string( pName != nullptr && *pName != '\0' ? pName : DefaultLibraryName );
        }() );
    return s_Wrapper;
  }
} // namespace ImageMagickWrapper
