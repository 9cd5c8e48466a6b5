// Feeds bytes to the attribute store's reader, reads every record from what it kept, and
// checks that the store and each record survive being written and read again unchanged.
// Comparison is by serial form, bit for bit, so that NaN values compare as themselves.

#include "utils/MemoryStream.h"
#include "videointerface/AttributeRecords.h"

#include <cstddef>
#include <cstdint>
#include <cstdlib>
#include <vector>

namespace
{
  using namespace ZOL;

  std::vector< std::uint8_t > Bytes( const IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    if( !i_rStore.WriteTo( Stream ) )
      std::abort();
    return Stream.GetData();
  }

  void Require( bool i_bCondition )
  {
    if( !i_bCondition )
      std::abort();
  }

  // Writes a record, reads it back and writes that again: both stores must be the same bytes.
  template < typename Record, typename Reader, typename Writer >
  void CheckRecord( const Record& i_rRecord, Reader i_Read, Writer i_Write )
  {
    IVideoAttributes First;
    if( !i_Write( First, i_rRecord ) )
      return;
    Record Again{};
    Require( i_Read( First, Again ) );
    IVideoAttributes Second;
    Require( i_Write( Second, Again ) );
    Require( Bytes( First ) == Bytes( Second ) );
  }

  void ReadEveryRecord( const IVideoAttributes& i_rStore, std::uint64_t i_FrameIndex )
  {
    IVideoFrameInfo Frame;
    if( ReadVideoFrameInfo( i_rStore, i_rStore, Frame ) )
      CheckRecord(
          Frame, []( const IVideoAttributes& s, IVideoFrameInfo& r ) { return ReadVideoFrameInfo( s, s, r ); },
          []( IVideoAttributes& s, const IVideoFrameInfo& r ) { return WriteVideoFrameInfo( s, r ); } );

    IAudioFrameInfo Audio;
    if( ReadAudioFrameInfo( i_rStore, "", Audio ) )
      CheckRecord(
          Audio, []( const IVideoAttributes& s, IAudioFrameInfo& r ) { return ReadAudioFrameInfo( s, "", r ); },
          []( IVideoAttributes& s, const IAudioFrameInfo& r ) { return WriteAudioFrameInfo( s, "", r ); } );

    IVideoTiming Timing;
    if( ReadVideoTiming( i_rStore, Timing ) )
      CheckRecord(
          Timing, []( const IVideoAttributes& s, IVideoTiming& r ) { return ReadVideoTiming( s, r ); },
          []( IVideoAttributes& s, const IVideoTiming& r ) { return WriteVideoTiming( s, r ); } );

    IVideoSettings Settings;
    if( ReadVideoSettings( i_rStore, "", Settings ) )
      CheckRecord(
          Settings, []( const IVideoAttributes& s, IVideoSettings& r ) { return ReadVideoSettings( s, "", r ); },
          []( IVideoAttributes& s, const IVideoSettings& r ) { return WriteVideoSettings( s, "", r ); } );

    ITimecode Timecode;
    if( ReadTimecode( i_rStore, Timecode ) )
      CheckRecord(
          Timecode, []( const IVideoAttributes& s, ITimecode& r ) { return ReadTimecode( s, r ); },
          []( IVideoAttributes& s, const ITimecode& r ) { return WriteTimecode( s, r ); } );
    // Timecode arithmetic on whatever the file says; the text must be empty exactly when the
    // record is unusable.
    for( int Style = 0; Style <= 5; ++Style )
      Require( Timecode.ToText( Style, true, Style % 2 == 0 ).empty() == !Timecode.IsValid() );
    GetFrameTimecodeText( Timecode, Timing, i_FrameIndex );
    ITimecode Moved = Timecode;
    Moved.AddTicks( static_cast< std::int64_t >( i_FrameIndex ) );
    Require( Moved.UserBits == Timecode.UserBits );

    CoreLumekTypes::VLensDistortionCalibration Lens;
    if( ReadLensDistortionCalibration( i_rStore, "", Lens ) )
      CheckRecord(
          Lens,
          []( const IVideoAttributes& s, CoreLumekTypes::VLensDistortionCalibration& r )
          { return ReadLensDistortionCalibration( s, "", r ); },
          []( IVideoAttributes& s, const CoreLumekTypes::VLensDistortionCalibration& r )
          { return WriteLensDistortionCalibration( s, "", r ); } );

    CoreLumekTypes::VCameraHardware Camera;
    if( ReadCameraHardware( i_rStore, Camera ) )
      CheckRecord(
          Camera,
          []( const IVideoAttributes& s, CoreLumekTypes::VCameraHardware& r ) { return ReadCameraHardware( s, r ); },
          []( IVideoAttributes& s, const CoreLumekTypes::VCameraHardware& r ) { return WriteCameraHardware( s, r ); } );

    std::vector< VConversionRecord > Records;
    ReadConversionRecords( i_rStore, Records );
    Require( Records.size() <= i_rStore.Size() );

    // What the properties panel does with every key.
    for( const auto& rEntry : i_rStore.GetMap() )
    {
      std::string Text;
      Require( i_rStore.GetValueAsString( rEntry.first, Text ) );
      IVideoAttributes Copy = i_rStore;
      Copy.SetValueFromString( rEntry.first, Text );
    }
  }
} // namespace

extern "C" int LLVMFuzzerTestOneInput( const std::uint8_t* i_pData, std::size_t i_Size )
{
  UtilsIO::VMemoryInputStream Input( i_pData, i_Size );
  IVideoAttributes Store;
  Store.ReadFrom( Input );

  std::uint64_t FrameIndex = 0;
  for( std::size_t i = 0; i < 8 && i < i_Size; ++i )
    FrameIndex = ( FrameIndex << 8 ) | i_pData[i];
  ReadEveryRecord( Store, FrameIndex );

  const std::vector< std::uint8_t > Written = Bytes( Store );
  UtilsIO::VMemoryInputStream Again( Written.data(), Written.size() );
  IVideoAttributes Read;
  Require( Read.ReadFrom( Again ) );
  Require( Read.Size() == Store.Size() );
  Require( Bytes( Read ) == Written );
  return 0;
}
