// The layouts of the header and sample table atoms: which fields are kept, and which must hold
// the one value the accepted family of files uses.

#include "fileio/MovIO/MovReadAtom.h"

#include <algorithm>

namespace MovIO
{
  namespace
  {
    struct VVideoFormatRow
    {
      std::uint32_t DataFormat;
      // 0: any depth.
      std::uint16_t Depth;
      ZOL::EVideoPayload Payload;
      ZOL::EPixelFormat PixelFormat;
    };

    constexpr VVideoFormatRow s_VideoFormats[] = {
        { FourCC( "yuvs" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_Y8U8Y8V8 },
        { FourCC( "2vuy" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_U8Y8V8Y8 },
        { FourCC( "v210" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_U10Y10V10Y10 },
        { FourCC( "raw " ), 24, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_R8G8B8 },
        { FourCC( "RGBA" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_R8G8B8u8 },
        { FourCC( "24BG" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_B8G8R8 },
        { FourCC( "BGRA" ), 0, ZOL::VideoPayload_Uncompressed, ZOL::PixelFormat_B8G8R8u8 },
        { FourCC( "jpeg" ), 0, ZOL::VideoPayload_ImageJPEG, ZOL::PixelFormat_Unspecified },
        { FourCC( "png " ), 0, ZOL::VideoPayload_ImagePNG, ZOL::PixelFormat_Unspecified },
        { FourCC( "tiff" ), 0, ZOL::VideoPayload_ImageTIFF, ZOL::PixelFormat_Unspecified },
        { FourCC( "avc1" ), 0, ZOL::VideoPayload_VideoH264, ZOL::PixelFormat_Unspecified },
    };

    const VVideoFormatRow* FindVideoFormat( std::uint32_t i_DataFormat, std::uint16_t i_Depth )
    {
      for( const VVideoFormatRow& rRow : s_VideoFormats )
        if( rRow.DataFormat == i_DataFormat && ( rRow.Depth == 0 || rRow.Depth == i_Depth ) )
          return &rRow;
      return nullptr;
    }

    constexpr std::uint32_t FixedSizeMvhd = 108;
    constexpr std::uint32_t FixedSizeTkhd = 92;
    constexpr std::uint32_t FixedSizeMdhd = 32;
    constexpr std::uint32_t FixedSizeTimecodeTable = 20;
    constexpr std::uint32_t FixedSizeFiel = 10;
    constexpr std::uint32_t FixedSizePasp = 16;
    constexpr std::uint32_t FixedSizeColr = 18;
  } // namespace

  bool VMovReader::ReadMvhd( const VMovAtom& i_rRoot )
  {
    return ReadAtom( i_rRoot, { "moov", "mvhd" }, FixedSizeMvhd,
                     [this]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       return r.Skip1() && r.Skip3() && r.Skip4() && r.Skip4() && r.ReadU32( m_FileTimescale ) &&
                              r.ReadU32( m_FileDuration ) && r.ExpectU32( 0x00010000 ) && r.ExpectU16( 0x0100 ) &&
                              r.ExpectU32( 0 ) && r.ExpectU32( 0 ) && r.ExpectU16( 0 ) && ExpectIdentityMatrix( r ) &&
                              r.ExpectU32( 0 ) && r.ExpectU32( 0 ) && r.ExpectU32( 0 ) && r.ExpectU32( 0 ) &&
                              r.ExpectU32( 0 ) && r.ExpectU32( 0 ) && r.Skip4();
                     } );
  }

  bool VMovReader::ReadTkhd( const VMovAtom& i_rTrak, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    return ReadAtom( i_rTrak, { "tkhd" }, FixedSizeTkhd,
                     [&]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       const bool bVideo = i_Kind == TrackKind_Video;
                       const bool bAudio = i_Kind == TrackKind_Audio;
                       if( !( r.ExpectU8( 0 ) && r.Skip3() && r.Skip4() && r.Skip4() && r.ReadU32( rTrack.TrackId ) &&
                              r.ExpectU32( 0 ) ) )
                         return false;
                       if( !( i_Kind == TrackKind_Timecode ? r.Skip4() : r.ReadU32( rTrack.FileDuration ) ) )
                         return false;
                       // An audio track may sit in an alternate group and have a volume; the others may not.
                       if( !( r.ExpectU32( 0 ) && r.ExpectU32( 0 ) && r.ExpectU16( 0 ) &&
                              ( bAudio ? r.Skip2() : r.ExpectU16( 0 ) ) && ( bAudio ? r.Skip2() : r.ExpectU16( 0 ) ) &&
                              r.ExpectU16( 0 ) && ExpectIdentityMatrix( r ) ) )
                         return false;
                       if( !bVideo )
                         return r.Skip4() && r.Skip4();
                       std::uint32_t Width = 0;
                       std::uint32_t Height = 0;
                       if( !r.ReadU32( Width ) || !r.ReadU32( Height ) )
                         return false;
                       m_VideoFrameInfo.ImageWidth = static_cast< std::int32_t >( Width >> 16 );
                       m_VideoFrameInfo.ImageHeight = static_cast< std::int32_t >( Height >> 16 );
                       return true;
                     } );
  }

  bool VMovReader::ReadElst( const VMovAtom& i_rTrak, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    return ReadAtom( i_rTrak, { "edts", "elst" }, 0,
                     [&]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) ) )
                         return false;
                       if( i_Kind == TrackKind_Timecode )
                         return r.ReadU32( rTrack.FileDuration ) && r.ReadU32( m_TimecodeDescription.MediaTime ) &&
                                r.ExpectU32( 0x00010000 );
                       std::uint32_t MediaTime = 0;
                       // Video may start later in its media (an edit that skips leading frames); audio may not.
                       return r.ExpectU32( rTrack.FileDuration ) &&
                              ( i_Kind == TrackKind_Audio ? r.ExpectU32( 0 ) : r.ReadU32( MediaTime ) ) &&
                              r.ExpectU32( 0x00010000 );
                     } );
  }

  bool VMovReader::ReadMdhd( const VMovAtom& i_rTrak, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    return ReadAtom( i_rTrak, { "mdia", "mdhd" }, FixedSizeMdhd,
                     [&]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       return r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.Skip4() && r.Skip4() &&
                              r.ReadU32( rTrack.Timescale ) && r.ReadU32( rTrack.Duration ) && r.Skip2() &&
                              ( i_Kind == TrackKind_Audio ? r.Skip2() : r.ExpectU16( 0 ) );
                     } );
  }

  bool VMovReader::ReadStts( const VMovAtom& i_rStbl, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    // One entry: the frame rate is constant.
    return ReadAtom( i_rStbl, { "stts" }, 0,
                     [&]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       return r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) &&
                              r.ReadU32( rTrack.SampleCount ) && r.ReadU32( rTrack.SampleDuration );
                     } );
  }

  bool VMovReader::ReadStsz( const VMovAtom& i_rStbl, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    if( i_Kind == TrackKind_Timecode )
      return ReadAtom( i_rStbl, { "stsz" }, FixedSizeTimecodeTable,
                       []( VMovPrimitiveReader& r, std::uint64_t )
                       { return r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 4 ) && r.ExpectU32( 1 ); } );
    if( i_Kind == TrackKind_Audio )
      return ReadAtom( i_rStbl, { "stsz" }, 0,
                       [&]( VMovPrimitiveReader& r, std::uint64_t )
                       {
                         const std::uint32_t FrameBytes = GetAudioSampleFrameBytes();
                         // Audio is copied out of chunks of these samples; more of them than the file holds is
                         // a damaged count.
                         return r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( FrameBytes ) &&
                                r.ExpectU32( rTrack.SampleCount ) &&
                                static_cast< std::uint64_t >( rTrack.SampleCount ) * FrameBytes <= r.GetFileSize();
                       } );
    return ReadAtom(
        i_rStbl, { "stsz" }, 0,
        [&]( VMovPrimitiveReader& r, std::uint64_t i_End )
        {
          std::uint32_t SampleSize = 0;
          if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ReadU32( SampleSize ) && r.ExpectU32( rTrack.SampleCount ) ) )
            return false;
          // The frame table has an entry for every sample: the samples must fit in the file (a
          // constant size) or their sizes in this atom (a table) before it is made.
          const std::uint64_t Count = rTrack.SampleCount;
          if( SampleSize != 0 ? Count * SampleSize > r.GetFileSize() : !TableFitsInAtom( r, i_End, Count, 4 ) )
            return false;
          m_Frames.assign( Count, VMovFrame() );
          if( SampleSize != 0 )
          {
            for( VMovFrame& rFrame : m_Frames )
              rFrame.Size = SampleSize;
            return true;
          }
          for( VMovFrame& rFrame : m_Frames )
            if( !r.ReadU32( rFrame.Size ) )
              return false;
          return true;
        } );
  }

  bool VMovReader::ReadStsc( const VMovAtom& i_rStbl, ETrackKind i_Kind )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    if( i_Kind == TrackKind_Timecode )
      return ReadAtom( i_rStbl, { "stsc" }, 0,
                       [&]( VMovPrimitiveReader& r, std::uint64_t )
                       {
                         if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) && r.ExpectU32( 1 ) &&
                                r.ExpectU32( 1 ) && r.ExpectU32( 1 ) ) )
                           return false;
                         for( VMovChunk& rChunk : rTrack.Chunks )
                         {
                           rChunk.FirstSample = 0;
                           rChunk.EndSample = 1;
                           rChunk.SampleCount = 1;
                         }
                         return true;
                       } );
    return ReadAtom( i_rStbl, { "stsc" }, 0,
                     [&]( VMovPrimitiveReader& r, std::uint64_t i_End )
                     {
                       std::uint32_t EntryCount = 0;
                       if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ReadU32( EntryCount ) ) ||
                           !TableFitsInAtom( r, i_End, EntryCount, 12 ) )
                         return false;
                       // First chunk and samples per chunk of each entry.
                       std::vector< std::uint32_t > Entries( static_cast< std::size_t >( EntryCount ) * 2 );
                       for( std::uint32_t i = 0; i < EntryCount; ++i )
                         if( !( r.ReadU32( Entries[2 * i] ) && r.ReadU32( Entries[2 * i + 1] ) && r.ExpectU32( 1 ) ) )
                           return false;
                       return ExpandSampleToChunk( rTrack, Entries, i_Kind == TrackKind_Video );
                     } );
  }

  bool VMovReader::ReadChunkOffsetTable( const VMovAtom& i_rStbl, ETrackKind i_Kind, bool i_b64 )
  {
    VMovTrack& rTrack = TrackOf( i_Kind );
    const bool bTimecode = i_Kind == TrackKind_Timecode;
    const std::uint32_t FixedSize = bTimecode && !i_b64 ? FixedSizeTimecodeTable : 0;
    return ReadAtom( i_rStbl, { i_b64 ? "co64" : "stco" }, FixedSize,
                     [&]( VMovPrimitiveReader& r, std::uint64_t i_End )
                     {
                       std::uint32_t Count = 0;
                       if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ReadU32( Count ) ) )
                         return false;
                       if( ( bTimecode && Count != 1 ) || !TableFitsInAtom( r, i_End, Count, i_b64 ? 8 : 4 ) )
                         return false;
                       rTrack.Chunks.assign( Count, VMovChunk() );
                       for( VMovChunk& rChunk : rTrack.Chunks )
                       {
                         std::uint32_t Offset32 = 0;
                         if( !( i_b64 ? r.ReadU64( rChunk.Offset ) : r.ReadU32( Offset32 ) ) )
                           return false;
                         if( !i_b64 )
                           rChunk.Offset = Offset32;
                       }
                       return true;
                     } );
  }

  bool VMovReader::ReadChunkOffsets( const VMovAtom& i_rStbl, ETrackKind i_Kind )
  {
    // A broken 64-bit table is forgiven when a 32-bit one is there.
    if( ReadChunkOffsetTable( i_rStbl, i_Kind, true ) )
      return true;
    TrackOf( i_Kind ).Chunks.clear();
    return ReadChunkOffsetTable( i_rStbl, i_Kind, false );
  }

  bool VMovReader::ReadVideoStsd( const VMovAtom& i_rStbl )
  {
    return ReadAtom( i_rStbl, { "stsd" }, 0,
                     [&]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       std::uint32_t DescriptionSize = 0;
                       std::uint32_t DataFormat = 0;
                       if( !( r.ExpectU8( 0 ) && r.ExpectU24( 0 ) && r.ExpectU32( 1 ) ) )
                         return false;
                       const std::uint64_t DescriptionStart = r.Tell();
                       std::uint16_t Depth = 0;
                       std::uint16_t ColourTable = 0;
                       if( !( r.ReadU32( DescriptionSize ) && r.ReadU32( DataFormat ) && r.ExpectU32( 0 ) &&
                              r.ExpectU16( 0 ) && r.ExpectU16( 1 ) && r.Skip2() && r.Skip2() && r.Skip4() &&
                              r.Skip4() && r.Skip4() && r.Skip2() && r.Skip2() && r.ExpectFixed16( 72.0 ) &&
                              r.ExpectFixed16( 72.0 ) && r.ExpectU32( 0 ) && r.ExpectU16( 1 ) &&
                              r.SkipFixedPascalString( 32 ) && r.ReadU16( Depth ) && r.ReadU16( ColourTable ) ) )
                         return false;
                       const VVideoFormatRow* pFormat = FindVideoFormat( DataFormat, Depth );
                       if( pFormat == nullptr )
                       {
                         // The number, not the text: the line has always shown the FourCC so.
                         LUMEK_LOG( "MovIO", ZOL::LogFailure, "FourCC code '%s' is not supported.", DataFormat );
                         return false;
                       }
                       m_VideoPayload = pFormat->Payload;
                       m_VideoFrameInfo.PixelFormat = pFormat->PixelFormat;
                       const std::uint64_t Consumed = r.Tell() - DescriptionStart;
                       if( DescriptionSize <= Consumed )
                         return true;
                       return ReadVideoExtensions( DescriptionSize - Consumed );
                     } );
  }

  bool VMovReader::ReadVideoExtensions( std::uint64_t i_Length )
  {
    VMovAtom Extensions;
    Extensions.Position = m_pReader->Tell();
    Extensions.Size = i_Length;
    if( !BuildAtomTree( *m_pReader, Extensions ) )
      return false;
    // An extension that is absent is fine; one that is present must read.
    const auto ReadOptional = [&]( const char* i_pName, auto&& i_Read )
    { return FindAtom( Extensions, { i_pName } ) == nullptr || i_Read(); };
    return ReadOptional( "fiel",
                         [&]
                         {
                           return ReadAtom( Extensions, { "fiel" }, FixedSizeFiel,
                                            [this]( VMovPrimitiveReader& r, std::uint64_t )
                                            {
                                              std::uint8_t Fields = 0;
                                              if( !r.ReadU8( Fields ) )
                                                return false;
                                              if( Fields != 1 )
                                              {
                                                LUMEK_LOG( "MovIO", ZOL::LogFailure,
                                                           "Opening interlaced files is not supported." );
                                                return false;
                                              }
                                              m_VideoFrameInfo.InterlacedFormat = ZOL::InterlacedFormat_NotInterlaced;
                                              return r.Skip1();
                                            } );
                         } ) &&
           ReadOptional( "avcC", [&] { return ReadAvcC( Extensions ); } ) &&
           ReadOptional( "pasp",
                         [&]
                         {
                           return ReadAtom( Extensions, { "pasp" }, FixedSizePasp,
                                            [this]( VMovPrimitiveReader& r, std::uint64_t )
                                            {
                                              std::uint32_t Horizontal = 0;
                                              std::uint32_t Vertical = 0;
                                              if( !r.ReadU32( Horizontal ) || !r.ReadU32( Vertical ) )
                                                return false;
                                              // A zero spacing describes no pixel; the default stays.
                                              if( Horizontal != 0 && Vertical != 0 )
                                                m_VideoFrameInfo.PixelAspectRatio =
                                                    static_cast< double >( Horizontal ) / Vertical;
                                              return true;
                                            } );
                         } ) &&
           ReadOptional( "colr",
                         [&]
                         {
                           // Only BT.709 is drawn correctly, so any other description refuses the file.
                           return ReadAtom( Extensions, { "colr" }, FixedSizeColr,
                                            []( VMovPrimitiveReader& r, std::uint64_t ) {
                                              return r.ExpectFourCC( "nclc" ) && r.ExpectU16( 1 ) && r.ExpectU16( 1 ) &&
                                                     r.ExpectU16( 1 );
                                            } );
                         } );
  }

  bool VMovReader::ReadAvcC( const VMovAtom& i_rExtensions )
  {
    return ReadAtom( i_rExtensions, { "avcC" }, 0,
                     [this]( VMovPrimitiveReader& r, std::uint64_t )
                     {
                       // One shape only: 4-byte NAL lengths and exactly one SPS.
                       if( !( r.ExpectU8( 1 ) && r.Skip1() && r.Skip1() && r.Skip1() && r.ExpectU8( 0xFF ) &&
                              r.ExpectU8( 0xE1 ) && ReadParameterSet( m_SPS ) ) )
                         return false;
                       std::uint8_t PPSCount = 0;
                       if( !r.ReadU8( PPSCount ) )
                         return false;
                       for( std::uint8_t i = 0; i < PPSCount; ++i )
                         if( !ReadParameterSet( m_PPS ) )
                           return false;
                       return true;
                     } );
  }

  bool VMovReader::ReadParameterSet( std::vector< std::shared_ptr< ZOL::IBuffer > >& io_rList )
  {
    VMovPrimitiveReader& r = *m_pReader;
    std::uint16_t Length = 0;
    if( !r.ReadU16( Length ) || !m_pCompressedAllocator )
      return false;
    // Stored with a 4-byte length in front, the form of the NAL units of a sample, so that a set
    // can go in front of a sample as it is.
    std::shared_ptr< ZOL::IBuffer > pSet;
    m_pCompressedAllocator->Allocate( pSet, Length + 4u );
    if( !pSet )
      return false;
    std::uint8_t* pData = pSet->GetData();
    pData[0] = 0;
    pData[1] = 0;
    pData[2] = static_cast< std::uint8_t >( Length >> 8 );
    pData[3] = static_cast< std::uint8_t >( Length & 0xFF );
    if( !r.Read( pData + 4, Length ) )
      return false;
    io_rList.push_back( std::move( pSet ) );
    return true;
  }
} // namespace MovIO
