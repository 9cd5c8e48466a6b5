#include "fileio/ImageSequenceIO/ImageHeader.h"

#include "utils/UtilsFileSystem/LongPath.h"

#include <cstdio>
#include <cstring>
#include <limits>
#include <memory>

namespace ImageSequenceIO
{
  namespace
  {
    // A JPEG may put many application segments before its frame header; a file that has more
    // than this is not worth walking further.
    constexpr int MaxJPEGSegments = 1024;
    constexpr std::uint16_t MaxTIFFEntries = 4096;

    std::uint32_t LoadBE( const std::uint8_t* i_pBytes, int i_Count )
    {
      std::uint32_t Value = 0;
      for( int i = 0; i < i_Count; ++i )
        Value = ( Value << 8 ) | i_pBytes[i];
      return Value;
    }

    std::uint32_t Load( const std::uint8_t* i_pBytes, int i_Count, bool i_bLittleEndian )
    {
      if( !i_bLittleEndian )
        return LoadBE( i_pBytes, i_Count );
      std::uint32_t Value = 0;
      for( int i = i_Count; i-- > 0; )
        Value = ( Value << 8 ) | i_pBytes[i];
      return Value;
    }

    std::optional< VImageSize > MakeSize( std::uint32_t i_Width, std::uint32_t i_Height )
    {
      constexpr auto Max = static_cast< std::uint32_t >( std::numeric_limits< std::int32_t >::max() );
      if( i_Width == 0 || i_Height == 0 || i_Width > Max || i_Height > Max )
        return std::nullopt;
      return VImageSize{ static_cast< std::int32_t >( i_Width ), static_cast< std::int32_t >( i_Height ) };
    }

    std::optional< VImageSize > ReadPNGSize( const VReadAt& i_rReadAt )
    {
      static const std::uint8_t s_Signature[8] = { 0x89, 'P', 'N', 'G', 0x0D, 0x0A, 0x1A, 0x0A };
      std::uint8_t Head[24];
      if( !i_rReadAt( 0, Head, sizeof( Head ) ) || std::memcmp( Head, s_Signature, 8 ) != 0 ||
          std::memcmp( Head + 12, "IHDR", 4 ) != 0 )
        return std::nullopt;
      return MakeSize( LoadBE( Head + 16, 4 ), LoadBE( Head + 20, 4 ) );
    }

    bool IsFrameHeader( std::uint8_t i_Marker )
    {
      // SOF0 to SOF15, but for DHT (C4), JPG (C8) and DAC (CC) that share the range.
      return i_Marker >= 0xC0 && i_Marker <= 0xCF && i_Marker != 0xC4 && i_Marker != 0xC8 && i_Marker != 0xCC;
    }

    std::optional< VImageSize > ReadJPEGSize( const VReadAt& i_rReadAt )
    {
      std::uint8_t Bytes[2];
      if( !i_rReadAt( 0, Bytes, 2 ) || Bytes[0] != 0xFF || Bytes[1] != 0xD8 )
        return std::nullopt;
      std::uint64_t Position = 2;
      for( int Segment = 0; Segment < MaxJPEGSegments; ++Segment )
      {
        if( !i_rReadAt( Position, Bytes, 2 ) || Bytes[0] != 0xFF )
          return std::nullopt;
        const std::uint8_t Marker = Bytes[1];
        Position += 2;
        // Fill bytes and markers without a length.
        if( Marker == 0xFF )
        {
          Position -= 1;
          continue;
        }
        if( Marker == 0x01 || ( Marker >= 0xD0 && Marker <= 0xD8 ) )
          continue;
        // Image data or the end before any frame header: there is no size to find.
        if( Marker == 0xDA || Marker == 0xD9 )
          return std::nullopt;
        std::uint8_t Header[7];
        if( !i_rReadAt( Position, Header, 2 ) )
          return std::nullopt;
        const std::uint32_t Length = LoadBE( Header, 2 );
        if( Length < 2 )
          return std::nullopt;
        if( IsFrameHeader( Marker ) )
        {
          if( Length < 7 || !i_rReadAt( Position, Header, 7 ) )
            return std::nullopt;
          return MakeSize( LoadBE( Header + 5, 2 ), LoadBE( Header + 3, 2 ) );
        }
        Position += Length;
      }
      return std::nullopt;
    }

    std::optional< VImageSize > ReadTIFFSize( const VReadAt& i_rReadAt )
    {
      std::uint8_t Head[8];
      if( !i_rReadAt( 0, Head, sizeof( Head ) ) )
        return std::nullopt;
      bool bLittleEndian = false;
      if( std::memcmp( Head, "II\x2A\x00", 4 ) == 0 )
        bLittleEndian = true;
      else if( std::memcmp( Head, "MM\x00\x2A", 4 ) != 0 )
        return std::nullopt;
      const std::uint64_t Directory = Load( Head + 4, 4, bLittleEndian );
      std::uint8_t Count[2];
      if( !i_rReadAt( Directory, Count, 2 ) )
        return std::nullopt;
      const std::uint16_t Entries = static_cast< std::uint16_t >( Load( Count, 2, bLittleEndian ) );
      std::uint32_t Width = 0;
      std::uint32_t Height = 0;
      for( std::uint16_t i = 0; i < Entries && i < MaxTIFFEntries && ( Width == 0 || Height == 0 ); ++i )
      {
        std::uint8_t Entry[12];
        if( !i_rReadAt( Directory + 2 + 12ull * i, Entry, sizeof( Entry ) ) )
          return std::nullopt;
        const std::uint32_t Tag = Load( Entry, 2, bLittleEndian );
        const std::uint32_t Type = Load( Entry + 2, 2, bLittleEndian );
        // SHORT (3) or LONG (4), one value, held in the entry itself.
        if( ( Tag != 256 && Tag != 257 ) || ( Type != 3 && Type != 4 ) )
          continue;
        const std::uint32_t Value = Load( Entry + 8, Type == 3 ? 2 : 4, bLittleEndian );
        ( Tag == 256 ? Width : Height ) = Value;
      }
      return MakeSize( Width, Height );
    }
  } // namespace

  VFileHandle OpenImageFile( const std::string& i_rPath )
  {
#ifdef _WIN32
    const std::string Path = UtilsFileSystem::MakeLongPath( i_rPath );
#else
    // Linux takes the path as given: the long form only matters where names are limited.
    const std::string& Path = i_rPath;
#endif
    return VFileHandle( std::fopen( Path.c_str(), "rb" ), &std::fclose );
  }

  std::optional< VImageSize > ReadImageSize( ZOL::EVideoPayload i_Payload, const VReadAt& i_rReadAt )
  {
    switch( i_Payload )
    {
    case ZOL::VideoPayload_ImageJPEG:
      return ReadJPEGSize( i_rReadAt );
    case ZOL::VideoPayload_ImagePNG:
      return ReadPNGSize( i_rReadAt );
    case ZOL::VideoPayload_ImageTIFF:
      return ReadTIFFSize( i_rReadAt );
    default:
      return std::nullopt;
    }
  }

  std::optional< VImageSize > ReadImageSize( ZOL::EVideoPayload i_Payload, const std::uint8_t* i_pData,
                                             std::uint64_t i_Size )
  {
    return ReadImageSize( i_Payload,
                          [&]( std::uint64_t i_Offset, void* o_pDestination, std::size_t i_Count )
                          {
                            if( i_Offset > i_Size || i_Count > i_Size - i_Offset )
                              return false;
                            std::memcpy( o_pDestination, i_pData + i_Offset, i_Count );
                            return true;
                          } );
  }

  std::optional< VImageSize > ReadImageFileSize( ZOL::EVideoPayload i_Payload, const std::string& i_rPath )
  {
    const VFileHandle pFile = OpenImageFile( i_rPath );
    if( !pFile )
      return std::nullopt;
    return ReadImageSize( i_Payload,
                          [&]( std::uint64_t i_Offset, void* o_pDestination, std::size_t i_Count )
                          {
                            if( i_Offset > static_cast< std::uint64_t >( std::numeric_limits< off_t >::max() ) ||
                                fseeko( pFile.get(), static_cast< off_t >( i_Offset ), SEEK_SET ) != 0 )
                              return false;
                            return std::fread( o_pDestination, 1, i_Count, pFile.get() ) == i_Count;
                          } );
  }
} // namespace ImageSequenceIO
