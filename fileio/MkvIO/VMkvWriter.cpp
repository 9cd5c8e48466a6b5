#include "fileio/MkvIO/VMkvWriter.h"

#include "fileio/MkvIO/MkvCodecs.h"
#include "fileio/MkvIO/VMkvIOCallback.h"
#include "videointerface/AttributeRecords.h"

#include <ebml/EbmlHead.h>
#include <ebml/EbmlSubHead.h>
#include <ebml/EbmlVoid.h>
#include <matroska/KaxBlock.h>
#include <matroska/KaxCluster.h>
#include <matroska/KaxCues.h>
#include <matroska/KaxInfo.h>
#include <matroska/KaxInfoData.h>
#include <matroska/KaxSegment.h>
#include <matroska/KaxSemantic.h>
#include <matroska/KaxTag.h>
#include <matroska/KaxTags.h>
#include <matroska/KaxTrackAudio.h>
#include <matroska/KaxTrackEntryData.h>
#include <matroska/KaxTrackVideo.h>
#include <matroska/KaxTracks.h>

#include <boost/lexical_cast.hpp>

#include <array>
#include <cmath>
#include <ctime>
#include <exception>
#include <map>
#include <random>

using namespace libebml;
using namespace libmatroska;

namespace MkvIO
{
  namespace
  {
    constexpr std::uint64_t TimecodeScale = 1000000; // timestamps in milliseconds
    const binary s_SegmentId[4] = { 0x18, 0x53, 0x80, 0x67 };
    // The Segment's size is written as eight bytes: unknown while writing, filled in at the end.
    constexpr std::size_t SegmentSizeLength = 8;
    // A BlockGroup that holds only a BlockDuration of 1.
    const binary s_GroupWithoutBlock[6] = { 0xA0, 0x84, 0x9B, 0x82, 0x00, 0x01 };

    std::string ValueText( const ZOL::IVideoAttributes& i_rStore, const std::string& i_rKey )
    {
      double Double = 0.0;
      float Float = 0.0f;
      // Floats in full: the default text keeps six digits, and a tag must give the value back.
      if( i_rStore.Get( i_rKey, Double ) )
        return boost::lexical_cast< std::string >( Double );
      if( i_rStore.Get( i_rKey, Float ) )
        return boost::lexical_cast< std::string >( Float );
      std::string Text;
      (void)i_rStore.GetValueAsString( i_rKey, Text );
      return Text;
    }

    void AppendTags( const ZOL::IVideoAttributes& i_rStore, const std::string& i_rPrefix,
                     std::vector< std::pair< std::string, std::string > >& io_rTags )
    {
      for( const auto& rEntry : i_rStore.GetMap() )
        io_rTags.emplace_back( i_rPrefix + rEntry.first, ValueText( i_rStore, rEntry.first ) );
    }

    std::array< binary, BitmapInfoHeaderSize > BitmapInfoHeader( const VMkvVideoTrack& i_rVideo )
    {
      std::array< binary, BitmapInfoHeaderSize > Header{};
      auto PutLE32 = [&]( std::size_t i_Offset, std::uint32_t i_Value )
      {
        for( int i = 0; i < 4; ++i )
          Header[i_Offset + i] = static_cast< binary >( i_Value >> ( 8 * i ) );
      };
      PutLE32( 0, BitmapInfoHeaderSize );
      PutLE32( 4, i_rVideo.Width );
      PutLE32( 8, i_rVideo.Height );
      Header[12] = 1; // planes
      for( std::size_t i = 0; i < 4 && i < i_rVideo.FourCC.size(); ++i )
        Header[BitmapInfoFourCCOffset + i] = static_cast< binary >( i_rVideo.FourCC[i] );
      return Header;
    }
  } // namespace

  bool DescribeForMatroska( const ZOL::IVideoFrameInfo& i_rVideo, bool i_bJPEG, const ZOL::IAudioFrameInfo& i_rAudio,
                            const ZOL::IVideoTiming& i_rTiming, const ZOL::ITimecode& i_rTimecode,
                            const ZOL::IVideoSettings& i_rSettings, VMkvDescription& o_rDescription )
  {
    if( i_rVideo.ImageWidth <= 0 || i_rVideo.ImageHeight <= 0 )
      return false;
    VMkvDescription Description;
    Description.Video.Width = static_cast< std::uint32_t >( i_rVideo.ImageWidth );
    Description.Video.Height = static_cast< std::uint32_t >( i_rVideo.ImageHeight );
    if( i_bJPEG )
      Description.Video.CodecID = CodecMJPEG;
    else
    {
      Description.Video.CodecID = CodecUncompressed;
      Description.Video.FourCC = FourCCForPixelFormat( i_rVideo.PixelFormat );
      if( Description.Video.FourCC.empty() )
        return false;
    }
    if( i_rAudio.IsUsable() )
    {
      std::uint64_t BitDepth = 0;
      if( !CodecForSampleFormat( i_rAudio.SampleFormat, Description.Audio.CodecID, BitDepth ) )
        return false;
      Description.Audio.BitDepth = static_cast< std::uint32_t >( BitDepth );
      Description.Audio.Channels = static_cast< std::uint32_t >( i_rAudio.Channels );
      Description.Audio.SamplingFrequency = i_rAudio.SampleRate;
    }
    Description.FramesPerSecond = i_rTiming.GetFrameRate() > 0.0 ? i_rTiming.GetFrameRate() : 25.0;

    ZOL::IVideoAttributes Internal;
    ZOL::IVideoAttributes External;
    ZOL::WriteVideoFrameInfo( Internal, i_rVideo );
    ZOL::WriteAudioFrameInfo( Internal, "", i_rAudio );
    ZOL::WriteVideoTiming( External, i_rTiming );
    ZOL::WriteTimecode( External, i_rTimecode );
    ZOL::WriteVideoSettings( External, "", i_rSettings );
    AppendTags( Internal, "Lumek.Internal.", Description.Tags );
    AppendTags( External, "Lumek.External.", Description.Tags );
    o_rDescription = std::move( Description );
    return true;
  }

  struct VMkvWriter::VState
  {
    VMkvIOCallback File;
    VMkvDescription Description;
    KaxSegment Segment;
    KaxInfo Info;
    KaxTracks Tracks;
    KaxCues Cues;
    // Track entries by number, for blocks of tracks the file does not declare as well.
    std::map< std::uint16_t, KaxTrackEntry* > TrackEntries;
    std::vector< std::unique_ptr< KaxTrackEntry > > ExtraEntries;
    std::uint64_t SegmentPosition = 0;
    std::uint64_t InfoPosition = 0;
    std::uint64_t FrameCount = 0;
    bool bFailed = false;

    bool WriteHead();
    void WriteInfo( double i_Duration );
    void WriteTracks();
    void WriteTags();
    KaxTrackEntry& TrackEntry( std::uint16_t i_Number );
    double FrameTimeInNanoseconds( std::uint64_t i_Frame ) const
    {
      return static_cast< double >( i_Frame ) * 1e9 / Description.FramesPerSecond;
    }
  };

  bool VMkvWriter::VState::WriteHead()
  {
    EbmlHead Head;
    GetChild< EDocType >( Head ).SetValue( "matroska" );
    GetChild< EDocTypeVersion >( Head ).SetValue( 4 );
    GetChild< EDocTypeReadVersion >( Head ).SetValue( 2 );
    Head.Render( File, false );

    SegmentPosition = File.getFilePointer();
    const binary UnknownSize[SegmentSizeLength] = { 0x01, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF };
    File.writeFully( s_SegmentId, sizeof( s_SegmentId ) );
    File.writeFully( UnknownSize, sizeof( UnknownSize ) );
    return File.WritesGood();
  }

  void VMkvWriter::VState::WriteInfo( double i_Duration )
  {
    GetChild< KaxTimecodeScale >( Info ).SetValue( TimecodeScale );
    auto& rDuration = GetChild< KaxDuration >( Info );
    rDuration.SetPrecision( EbmlFloat::FLOAT_64 );
    rDuration.SetValue( i_Duration );
    GetChild< KaxMuxingApp >( Info ).SetValueUTF8( "libebml and libmatroska" );
    GetChild< KaxWritingApp >( Info ).SetValueUTF8( Description.WritingApp );
    Info.Render( File, false );
  }

  void VMkvWriter::VState::WriteTracks()
  {
    std::mt19937_64 Random( static_cast< std::uint64_t >( std::time( nullptr ) ) );
    auto& rVideo = GetChild< KaxTrackEntry >( Tracks );
    rVideo.SetGlobalTimecodeScale( TimecodeScale );
    GetChild< KaxTrackNumber >( rVideo ).SetValue( VideoTrackNumber );
    GetChild< KaxTrackUID >( rVideo ).SetValue( Random() );
    GetChild< KaxTrackType >( rVideo ).SetValue( 1 );
    GetChild< KaxCodecID >( rVideo ).SetValue( Description.Video.CodecID );
    const VMkvVideoTrack& rTrack = Description.Video;
    if( rTrack.CodecID == CodecVfwFourCC )
    {
      const auto Header = BitmapInfoHeader( rTrack );
      GetChild< KaxCodecPrivate >( rVideo ).CopyBuffer( Header.data(), static_cast< uint32 >( Header.size() ) );
    }
    auto& rPicture = GetChild< KaxTrackVideo >( rVideo );
    GetChild< KaxVideoPixelWidth >( rPicture ).SetValue( rTrack.Width );
    GetChild< KaxVideoPixelHeight >( rPicture ).SetValue( rTrack.Height );
    GetChild< KaxVideoDisplayWidth >( rPicture ).SetValue( rTrack.DisplayWidth ? rTrack.DisplayWidth : rTrack.Width );
    GetChild< KaxVideoDisplayHeight >( rPicture )
        .SetValue( rTrack.DisplayHeight ? rTrack.DisplayHeight : rTrack.Height );
    if( rTrack.CodecID == CodecUncompressed && !rTrack.FourCC.empty() )
      GetChild< KaxVideoColourSpace >( rPicture )
          .CopyBuffer( reinterpret_cast< const binary* >( rTrack.FourCC.data() ),
                       static_cast< uint32 >( rTrack.FourCC.size() ) );
    TrackEntries[VideoTrackNumber] = &rVideo;

    if( !Description.Audio.CodecID.empty() )
    {
      auto& rAudio = AddNewChild< KaxTrackEntry >( Tracks );
      rAudio.SetGlobalTimecodeScale( TimecodeScale );
      GetChild< KaxTrackNumber >( rAudio ).SetValue( AudioTrackNumber );
      GetChild< KaxTrackUID >( rAudio ).SetValue( Random() );
      GetChild< KaxTrackType >( rAudio ).SetValue( 2 );
      GetChild< KaxCodecID >( rAudio ).SetValue( Description.Audio.CodecID );
      auto& rSound = GetChild< KaxTrackAudio >( rAudio );
      GetChild< KaxAudioSamplingFreq >( rSound ).SetValue( Description.Audio.SamplingFrequency );
      GetChild< KaxAudioChannels >( rSound ).SetValue( Description.Audio.Channels );
      GetChild< KaxAudioBitDepth >( rSound ).SetValue( Description.Audio.BitDepth );
      TrackEntries[AudioTrackNumber] = &rAudio;
    }
    Tracks.Render( File, false );
  }

  void VMkvWriter::VState::WriteTags()
  {
    if( Description.Tags.empty() )
      return;
    KaxTags Tags;
    auto& rTag = GetChild< KaxTag >( Tags );
    bool bFirst = true;
    for( const auto& rEntry : Description.Tags )
    {
      auto& rSimple = bFirst ? GetChild< KaxTagSimple >( rTag ) : AddNewChild< KaxTagSimple >( rTag );
      bFirst = false;
      GetChild< KaxTagName >( rSimple ).SetValueUTF8( rEntry.first );
      GetChild< KaxTagString >( rSimple ).SetValueUTF8( rEntry.second );
    }
    Tags.Render( File, false );
  }

  KaxTrackEntry& VMkvWriter::VState::TrackEntry( std::uint16_t i_Number )
  {
    auto Found = TrackEntries.find( i_Number );
    if( Found != TrackEntries.end() )
      return *Found->second;
    // A block for a track the file does not declare: only the tests write these.
    ExtraEntries.push_back( std::make_unique< KaxTrackEntry >() );
    KaxTrackEntry& rEntry = *ExtraEntries.back();
    rEntry.SetGlobalTimecodeScale( TimecodeScale );
    GetChild< KaxTrackNumber >( rEntry ).SetValue( i_Number );
    TrackEntries[i_Number] = &rEntry;
    return rEntry;
  }

  VMkvWriter::VMkvWriter() = default;

  VMkvWriter::~VMkvWriter()
  {
    if( m_pState )
      (void)Close();
  }

  bool VMkvWriter::Create( const std::string& i_rPath, const VMkvDescription& i_rDescription )
  {
    m_pState.reset();
    if( !( i_rDescription.FramesPerSecond > 0.0 ) )
      return false;
    auto pState = std::make_unique< VState >();
    pState->Description = i_rDescription;
    if( !pState->File.Open( i_rPath, true ) )
      return false;
    try
    {
      if( !pState->WriteHead() )
        return false;
      pState->InfoPosition = pState->File.getFilePointer();
      pState->WriteInfo( 0.0 );
      pState->WriteTracks();
      pState->WriteTags();
    }
    catch( const std::exception& )
    {
      return false;
    }
    if( !pState->File.WritesGood() )
      return false;
    m_pState = std::move( pState );
    return true;
  }

  bool VMkvWriter::WriteFrame( const std::vector< std::uint8_t >& i_rVideo,
                               const std::vector< std::uint8_t >& i_rAudio )
  {
    std::vector< VMkvBlock > Blocks( 1 );
    Blocks[0].Track = VideoTrackNumber;
    Blocks[0].Bytes = i_rVideo;
    if( m_pState && !m_pState->Description.Audio.CodecID.empty() )
    {
      Blocks.emplace_back();
      Blocks[1].Track = AudioTrackNumber;
      Blocks[1].Bytes = i_rAudio;
    }
    return WriteCluster( Blocks );
  }

  bool VMkvWriter::WriteCluster( const std::vector< VMkvBlock >& i_rBlocks )
  {
    if( !m_pState || m_pState->bFailed )
      return false;
    VState& rState = *m_pState;
    try
    {
      const auto Nanoseconds =
          static_cast< std::uint64_t >( std::llround( rState.FrameTimeInNanoseconds( rState.FrameCount ) ) );
      KaxCluster Cluster;
      std::vector< const EbmlVoid* > Placeholders;
      Cluster.SetParent( rState.Segment );
      Cluster.InitTimecode( Nanoseconds / TimecodeScale, TimecodeScale );
      for( const VMkvBlock& rBlock : i_rBlocks )
      {
        if( !rBlock.bWithBlock )
        {
          // libebml refuses to render a BlockGroup without its mandatory Block, so a Void of
          // the same length holds the place and is overwritten after the Cluster is out.
          auto& rVoid = AddNewChild< EbmlVoid >( Cluster );
          rVoid.SetSize( sizeof( s_GroupWithoutBlock ) - 2 );
          Placeholders.push_back( &rVoid );
          continue;
        }
        // The block takes the buffer object and deletes it; the bytes stay the caller's.
        auto* pData = new DataBuffer( const_cast< binary* >( rBlock.Bytes.data() ),
                                      static_cast< uint32 >( rBlock.Bytes.size() ) );
        KaxBlockGroup* pGroup = nullptr;
        Cluster.AddFrame( rState.TrackEntry( rBlock.Track ), Nanoseconds, *pData, pGroup, LACING_NONE );
      }
      Cluster.Render( rState.File, rState.Cues, false );
      const std::uint64_t End = rState.File.getFilePointer();
      for( const EbmlVoid* pVoid : Placeholders )
      {
        rState.File.setFilePointer( static_cast< int64 >( pVoid->GetElementPosition() ) );
        rState.File.writeFully( s_GroupWithoutBlock, sizeof( s_GroupWithoutBlock ) );
      }
      rState.File.setFilePointer( static_cast< int64 >( End ) );
    }
    catch( const std::exception& )
    {
      rState.bFailed = true;
      return false;
    }
    ++rState.FrameCount;
    return rState.File.WritesGood();
  }

  bool VMkvWriter::Close()
  {
    if( !m_pState )
      return false;
    std::unique_ptr< VState > pState = std::move( m_pState );
    VState& rState = *pState;
    bool bGood = !rState.bFailed;
    try
    {
      const std::uint64_t End = rState.File.getFilePointer();
      rState.File.setFilePointer( static_cast< int64 >( rState.InfoPosition ) );
      rState.WriteInfo( rState.FrameTimeInNanoseconds( rState.FrameCount ) / TimecodeScale );
      if( !rState.Description.bUnknownSegmentSize )
      {
        const std::uint64_t Size = End - ( rState.SegmentPosition + sizeof( s_SegmentId ) + SegmentSizeLength );
        binary Coded[SegmentSizeLength];
        Coded[0] = 0x01;
        for( std::size_t i = 1; i < SegmentSizeLength; ++i )
          Coded[i] = static_cast< binary >( Size >> ( 8 * ( SegmentSizeLength - 1 - i ) ) );
        rState.File.setFilePointer( static_cast< int64 >( rState.SegmentPosition + sizeof( s_SegmentId ) ) );
        rState.File.writeFully( Coded, sizeof( Coded ) );
      }
      rState.File.setFilePointer( static_cast< int64 >( End ) );
    }
    catch( const std::exception& )
    {
      bGood = false;
    }
    bGood = bGood && rState.File.WritesGood();
    rState.File.close();
    return bGood;
  }
} // namespace MkvIO
