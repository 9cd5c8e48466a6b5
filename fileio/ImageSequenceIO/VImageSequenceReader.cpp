#include "fileio/ImageSequenceIO/VImageSequenceReader.h"

#include "fileio/ImageSequenceIO/ImageHeader.h"
#include "fileio/VideoEncoding/VideoFrameDecoder.h"
#include "services/Log.h"
#include "utils/UtilsIO/VLargeFile.h"
#include "videointerface/AttributeRecords.h"
#include "videointerface/BufferAllocators.h"

#include <boost/filesystem/operations.hpp>
#include <boost/filesystem/path.hpp>

#include <algorithm>
#include <cerrno>
#include <limits>

namespace ImageSequenceIO
{
  const char* const FirstFileNumberKey = "ImageSequenceInfo.FirstFileNumber";

  namespace
  {
    namespace fs = boost::filesystem;

    constexpr const char* LogCategory = "ImageSequenceIO";
    // No still image of a recording comes near this; a larger file is not read into memory.
    constexpr std::uint64_t MaxFrameFileSize = 1ull << 30;
    // A pattern whose folder part holds a placeholder cannot be found by listing one folder:
    // its files are looked up one by one at Open, up to this many frames.
    constexpr std::uint64_t MaxProbedFrames = 1u << 16;
    // A numbered run without a descriptor has no rate of its own: it plays at 30 frames a second.
    constexpr std::uint32_t NumberedRunFramePeriod = ZOL::DefaultTicksPerSecond / 30;

    bool Exists( const std::string& i_rPath )
    {
      boost::system::error_code Error;
      return fs::exists( fs::path( i_rPath ), Error );
    }

    bool IsDigits( const std::string& i_rText )
    {
      return !i_rText.empty() &&
             std::all_of( i_rText.begin(), i_rText.end(), []( char c ) { return c >= '0' && c <= '9'; } );
    }

    std::vector< std::string > ListFolder( const std::string& i_rFolder )
    {
      std::vector< std::string > Names;
      boost::system::error_code Error;
      for( fs::directory_iterator It( fs::path( i_rFolder ), Error ), End; !Error && It != End; It.increment( Error ) )
        Names.push_back( It->path().filename().string() );
      return Names;
    }

    // Reads the whole file, through short and interrupted reads; true when every byte came.
    bool ReadWholeFile( std::FILE* i_pFile, std::uint8_t* o_pData, std::uint64_t i_Size )
    {
      std::uint64_t Done = 0;
      while( Done < i_Size )
      {
        const std::size_t Got = std::fread( o_pData + Done, 1, static_cast< std::size_t >( i_Size - Done ), i_pFile );
        Done += Got;
        if( Got != 0 )
          continue;
        if( std::ferror( i_pFile ) && errno == EINTR )
        {
          std::clearerr( i_pFile );
          continue;
        }
        break;
      }
      return Done == i_Size;
    }
  } // namespace

  VImageSequenceReader::VImageSequenceReader()
      : m_pAllocator( std::make_shared< ZOL::VReaderBufferAllocator >( "Unnamed" ) )
  {
  }

  void VImageSequenceReader::Reset()
  {
    m_Folder.clear();
    m_Payload = ZOL::VideoPayload_None;
    m_VideoFrameInfo = ZOL::IVideoFrameInfo();
    m_FrameKeys.Clear();
    m_Attributes.Clear();
    m_Timing = ZOL::IVideoTiming();
    m_Timecode = ZOL::ITimecode();
    m_Sequence = VSequenceInfo();
    m_Settings = ZOL::IVideoSettings();
    m_DescriptorPath.clear();
    m_FirstFileNumber = 0;
    m_Expander.reset();
    m_StoredFrames.clear();
    m_bOneFile = false;
    m_bOneFileExists = false;
  }

  bool VImageSequenceReader::OpenReader( const std::string& i_rFileName )
  {
    const fs::path Path( i_rFileName );
    const std::string Folder = Path.has_parent_path() ? Path.parent_path().string() : std::string( "." );
    const std::string Name = Path.filename().string();
    boost::system::error_code Error;
    if( !fs::is_directory( fs::path( Folder ), Error ) )
      return false;

    const bool bPlaceholder = Name.find( FramePlaceholder ) != std::string::npos ||
                              Name.find( FrameNumberPlaceholder ) != std::string::npos ||
                              Name.find( TimecodePlaceholder ) != std::string::npos;
    if( bPlaceholder || PayloadForExtension( Path.extension().string() ) == ZOL::VideoPayload_None )
      return OpenDescriptorFile( Folder, Name );
    return OpenNumberedImage( Folder, Name );
  }

  bool VImageSequenceReader::Open( const std::string& i_rFolder, ZOL::IInputStream& i_rDescriptor )
  {
    return OpenWith(
        [&]
        {
          // A damaged descriptor keeps what it gave before the damage; the pattern decides.
          ReadDescriptor( i_rDescriptor, m_FrameKeys, m_Attributes );
          return ApplyDescriptor( i_rFolder );
        } );
  }

  bool VImageSequenceReader::OpenDescriptorFile( const std::string& i_rFolder, const std::string& i_rFileName )
  {
    // The rule's own name first; the spelling without the separator when that is not there.
    const std::vector< std::string > Candidates = DescriptorCandidates( i_rFolder, i_rFileName );
    const auto Found = std::find_if( Candidates.begin(), Candidates.end(), &Exists );
    m_DescriptorPath = Found != Candidates.end() ? *Found : Candidates.front();

    UtilsIO::VLargeFile File;
    if( File.Open( m_DescriptorPath, UtilsIO::OpenMode_Read ) )
    {
      ReadDescriptor( File, m_FrameKeys, m_Attributes );
      File.Close();
    }
    return ApplyDescriptor( i_rFolder );
  }

  bool VImageSequenceReader::ApplyDescriptor( const std::string& i_rFolder )
  {
    m_Folder = i_rFolder;
    // Every record is optional here: the pattern alone decides whether the sequence opens.
    ZOL::ReadVideoFrameInfo( m_FrameKeys, m_Attributes, m_VideoFrameInfo );
    ZOL::ReadVideoTiming( m_Attributes, m_Timing );
    ZOL::ReadVideoSettings( m_Attributes, "", m_Settings );
    ZOL::ReadTimecode( m_Attributes, m_Timecode );
    ReadSequenceInfo( m_Attributes, m_Sequence );

    // Exact and case-sensitive, as container names are.
    m_Payload = PayloadForExtension( fs::path( m_Sequence.FileNamePattern ).extension().string() );
    if( m_Payload == ZOL::VideoPayload_None )
      return false;
    // The image decoders give colour for every stored format.
    m_VideoFrameInfo.PixelFormat = ZOL::PixelFormat_R8G8B8;
    m_Expander.emplace( m_Sequence.FileNamePattern, m_Sequence.FrameIndexPadWidth, m_Sequence.FrameNumberPadWidth,
                        m_Timecode, m_Timing );
    FindStoredFrames();
    // A descriptor that does not state the size leaves it to the images themselves.
    if( m_VideoFrameInfo.ImageWidth <= 0 || m_VideoFrameInfo.ImageHeight <= 0 )
    {
      const std::optional< std::uint64_t > First = FindStoredFrameAtOrAfter( 0 );
      if( First )
        ReadSizeFromImage( ExpandFileName( *First ) );
    }
    return true;
  }

  bool VImageSequenceReader::OpenNumberedImage( const std::string& i_rFolder, const std::string& i_rFileName )
  {
    const std::optional< VNumberedName > Numbered = SplitNumberedName( i_rFileName );
    const std::string Pattern =
        Numbered ? Numbered->Prefix + FramePlaceholder + Numbered->Suffix : std::string( i_rFileName );

    // A descriptor beside the run is the run's own only when its pattern names this file.
    for( const std::string& rDescriptor : DescriptorCandidates( i_rFolder, Pattern ) )
    {
      if( !Exists( rDescriptor ) )
        continue;
      if( OpenDescriptorFile( i_rFolder, fs::path( rDescriptor ).filename().string() ) &&
          m_Expander->FindIndex( i_rFileName, m_Sequence.FrameCount ) )
        return true;
      Reset();
      break;
    }

    m_Folder = i_rFolder;
    m_Payload = PayloadForExtension( fs::path( i_rFileName ).extension().string() );
    m_Timing.FramePeriodInTicks = NumberedRunFramePeriod;
    m_Sequence.FileNamePattern = Pattern;
    if( !Numbered )
    {
      m_Sequence.FrameCount = 1;
    }
    else
    {
      // The width of the numbers: the clicked name's when it is zero-padded, else the shortest
      // unpadded number of the run, so that take_9 and take_10 belong together.
      std::vector< std::string > Runs;
      for( const std::string& rName : ListFolder( i_rFolder ) )
      {
        const std::size_t Affixes = Numbered->Prefix.size() + Numbered->Suffix.size();
        if( rName.size() <= Affixes || rName.compare( 0, Numbered->Prefix.size(), Numbered->Prefix ) != 0 ||
            rName.compare( rName.size() - Numbered->Suffix.size(), std::string::npos, Numbered->Suffix ) != 0 )
          continue;
        std::string Digits = rName.substr( Numbered->Prefix.size(), rName.size() - Affixes );
        if( IsDigits( Digits ) && Digits.size() <= 20 )
          Runs.push_back( std::move( Digits ) );
      }
      std::size_t Width = Numbered->Digits.size();
      if( Numbered->Digits[0] != '0' )
        for( const std::string& rDigits : Runs )
          if( rDigits[0] != '0' )
            Width = std::min( Width, rDigits.size() );

      std::vector< std::uint64_t > Numbers;
      for( const std::string& rDigits : Runs )
      {
        const auto Value = static_cast< std::uint64_t >( std::stoull( rDigits ) );
        if( PadNumber( Value, static_cast< std::uint32_t >( Width ) ) == rDigits )
          Numbers.push_back( Value );
      }
      const std::uint64_t Clicked = std::stoull( Numbered->Digits );
      if( Numbers.empty() )
        Numbers.push_back( Clicked );
      std::sort( Numbers.begin(), Numbers.end() );
      Numbers.erase( std::unique( Numbers.begin(), Numbers.end() ), Numbers.end() );

      // The count is a 32-bit field: a run wider than that starts at the clicked file.
      constexpr std::uint64_t MaxCount = std::numeric_limits< std::uint32_t >::max();
      std::uint64_t First = Numbers.front();
      if( Clicked - First >= MaxCount )
        First = Clicked;
      const std::uint64_t Last = std::min( Numbers.back(), First + MaxCount - 1 );
      m_FirstFileNumber = First;
      m_Sequence.FrameIndexPadWidth = static_cast< std::uint32_t >( Width );
      m_Sequence.FrameNumberPadWidth = static_cast< std::uint32_t >( Width );
      m_Sequence.FrameCount = static_cast< std::uint32_t >( Last - First + 1 );
      for( const std::uint64_t Number : Numbers )
        if( Number >= First && Number <= Last )
          m_StoredFrames.push_back( Number - First );
    }
    m_Expander.emplace( m_Sequence.FileNamePattern, m_Sequence.FrameIndexPadWidth, m_Sequence.FrameNumberPadWidth,
                        m_Timecode, m_Timing, m_FirstFileNumber );
    if( !Numbered )
    {
      m_bOneFile = true;
      m_bOneFileExists = true;
    }

    // The properties list what the sequence was taken to be.
    WriteSequenceInfo( m_Attributes, m_Sequence );
    m_Attributes.Set( FirstFileNumberKey, m_FirstFileNumber );
    ZOL::WriteVideoTiming( m_Attributes, m_Timing );

    m_VideoFrameInfo.PixelFormat = ZOL::PixelFormat_R8G8B8;
    m_VideoFrameInfo.PixelAspectRatio = 1.0;
    if( ReadSizeFromImage( ( fs::path( i_rFolder ) / i_rFileName ).string() ) )
      return true;
    const std::optional< std::uint64_t > First = FindStoredFrameAtOrAfter( 0 );
    return First && ReadSizeFromImage( ExpandFileName( *First ) );
  }

  bool VImageSequenceReader::ReadSizeFromImage( const std::string& i_rPath )
  {
    const std::optional< VImageSize > Size = ReadImageFileSize( m_Payload, i_rPath );
    if( !Size )
      return false;
    m_VideoFrameInfo.ImageWidth = Size->Width;
    m_VideoFrameInfo.ImageHeight = Size->Height;
    return true;
  }

  void VImageSequenceReader::FindStoredFrames()
  {
    m_StoredFrames.clear();
    if( !m_Expander->DependsOnIndex() )
    {
      m_bOneFile = true;
      m_bOneFileExists = Exists( ExpandFileName( 0 ) );
      return;
    }
    const std::string& rPattern = m_Sequence.FileNamePattern;
    const std::size_t Slash = rPattern.find_last_of( '/' );
    const std::string SubFolder = Slash == std::string::npos ? std::string() : rPattern.substr( 0, Slash );
    if( SubFolder.find( '%' ) == std::string::npos )
    {
      ScanFolder( SubFolder );
      return;
    }
    const std::uint64_t Probed = std::min< std::uint64_t >( m_Sequence.FrameCount, MaxProbedFrames );
    for( std::uint64_t i = 0; i < Probed; ++i )
      if( Exists( ExpandFileName( i ) ) )
        m_StoredFrames.push_back( i );
  }

  void VImageSequenceReader::ScanFolder( const std::string& i_rSubFolder )
  {
    // One listing of the folder, each name turned back into its index: a long gap costs nothing.
    const std::string Prefix = i_rSubFolder.empty() ? std::string() : i_rSubFolder + "/";
    for( const std::string& rName : ListFolder( ( fs::path( m_Folder ) / i_rSubFolder ).string() ) )
    {
      const std::optional< std::uint64_t > Index = m_Expander->FindIndex( Prefix + rName, m_Sequence.FrameCount );
      if( Index )
        m_StoredFrames.push_back( *Index );
    }
    std::sort( m_StoredFrames.begin(), m_StoredFrames.end() );
    m_StoredFrames.erase( std::unique( m_StoredFrames.begin(), m_StoredFrames.end() ), m_StoredFrames.end() );
  }

  std::string VImageSequenceReader::ExpandFileName( std::uint64_t i_FrameIndex ) const
  {
    if( !m_Expander )
      return std::string();
    return ( fs::path( m_Folder ) / m_Expander->Expand( i_FrameIndex ) ).string();
  }

  bool VImageSequenceReader::HasFrame( std::uint64_t i_FrameIndex ) const
  {
    return m_Expander && Exists( ExpandFileName( i_FrameIndex ) );
  }

  std::uint64_t VImageSequenceReader::GetStoredFrameCount() const
  {
    if( m_bOneFile )
      return m_bOneFileExists ? m_Sequence.FrameCount : 0;
    return m_StoredFrames.size();
  }

  std::optional< std::uint64_t > VImageSequenceReader::FindStoredFrameAtOrBefore( std::uint64_t i_FrameIndex ) const
  {
    if( m_bOneFile )
    {
      if( !m_bOneFileExists || m_Sequence.FrameCount == 0 )
        return std::nullopt;
      return std::min< std::uint64_t >( i_FrameIndex, m_Sequence.FrameCount - 1 );
    }
    const auto Found = std::upper_bound( m_StoredFrames.begin(), m_StoredFrames.end(), i_FrameIndex );
    if( Found == m_StoredFrames.begin() )
      return std::nullopt;
    return *std::prev( Found );
  }

  std::optional< std::uint64_t > VImageSequenceReader::FindStoredFrameAtOrAfter( std::uint64_t i_FrameIndex ) const
  {
    if( m_bOneFile )
    {
      if( !m_bOneFileExists || i_FrameIndex >= m_Sequence.FrameCount )
        return std::nullopt;
      return i_FrameIndex;
    }
    const auto Found = std::lower_bound( m_StoredFrames.begin(), m_StoredFrames.end(), i_FrameIndex );
    if( Found == m_StoredFrames.end() )
      return std::nullopt;
    return *Found;
  }

  bool VImageSequenceReader::ReadFrameData( std::uint64_t i_FrameIndex, std::shared_ptr< ZOL::IBuffer >& o_rVideo,
                                            ZOL::IAudioBuffers&, bool i_bReadVideo, bool )
  {
    if( !i_bReadVideo )
      return true;
    if( i_FrameIndex == std::numeric_limits< std::uint64_t >::max() )
    {
      LUMEK_LOG( LogCategory, ZOL::LogFailure, "Frame index must be set." );
      return false;
    }
    const std::string Path = ExpandFileName( i_FrameIndex );
    boost::system::error_code Error;
    const std::uint64_t Size = Path.empty() ? 0 : fs::file_size( fs::path( Path ), Error );
    if( Path.empty() || Error )
    {
      LUMEK_LOG( LogCategory, ZOL::LogFailure, "Could not determine file size for file %s.", Path );
      return false;
    }
    if( Size > MaxFrameFileSize )
    {
      LUMEK_LOG( LogCategory, ZOL::LogFailure, "File %s of %d bytes is too large for a frame.", Path, Size );
      return false;
    }

    std::shared_ptr< ZOL::IBuffer > pVideo;
    m_pAllocator->Allocate( pVideo, Size );
    if( !pVideo )
      return false;
    const VFileHandle pFile = OpenImageFile( Path );
    const bool bRead = pFile && ReadWholeFile( pFile.get(), pVideo->GetData(), Size );
    // The buffer goes out even after a short read: the caller sees what came.
    o_rVideo = std::move( pVideo );
    return bRead;
  }

  bool VImageSequenceReader::ReadFrame( std::uint64_t i_FrameIndex, ZOL::IVideoFrame& o_rFrame, bool i_bReadVideo,
                                        bool i_bReadAudio )
  {
    return VideoEncoding::ReadDecodedFrame( *this, i_FrameIndex, o_rFrame, i_bReadVideo, i_bReadAudio, m_pAllocator,
                                            m_pAllocator, nullptr );
  }
} // namespace ImageSequenceIO
