#include "videointerface/IVideoAttributes.h"

#include "tests/support/AllocationWatch.h"
#include "tests/videointerface/AttributeTestSupport.h"

#include <gtest/gtest.h>

#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iterator>
#include <limits>
#include <tuple>

using LumekTest::Serialise;
using namespace ZOL;

namespace
{
  // A stream that cannot tell its size, as a socket or a pipe would be: ReadFrom has to guard
  // against lying lengths without asking.
  struct VForwardOnlyStream : ZOL::IInputStream
  {
    explicit VForwardOnlyStream( const std::vector< std::uint8_t >& i_rData ) : Memory( i_rData.data(), i_rData.size() )
    {
    }
    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override { return Memory.Read( o_pBuffer, i_Size ); }
    bool IsAtEnd() override { return Memory.IsAtEnd(); }
    UtilsIO::VMemoryInputStream Memory;
  };

  // Each malformed input is read from a stream that knows its size and from one that does not.
  bool ReadBytes( IVideoAttributes& o_rStore, const std::vector< std::uint8_t >& i_rBytes, bool i_bSeekable )
  {
    VForwardOnlyStream Forward( i_rBytes );
    return i_bSeekable ? o_rStore.ReadFrom( Forward.Memory ) : o_rStore.ReadFrom( Forward );
  }

  // Little-endian bytes written by hand, independent of the code under test.
  struct VBytes
  {
    std::vector< std::uint8_t > Data;
    VBytes& U32( std::uint32_t i_Value )
    {
      return Raw( { std::uint8_t( i_Value ), std::uint8_t( i_Value >> 8 ), std::uint8_t( i_Value >> 16 ),
                    std::uint8_t( i_Value >> 24 ) } );
    }
    VBytes& Raw( std::initializer_list< std::uint8_t > i_Bytes )
    {
      Data.insert( Data.end(), i_Bytes );
      return *this;
    }
    VBytes& Text( const std::string& i_rText )
    {
      U32( static_cast< std::uint32_t >( i_rText.size() ) );
      Data.insert( Data.end(), i_rText.begin(), i_rText.end() );
      return *this;
    }
  };

  template < typename T > IVideoAttributes One( const std::string& i_rKey, T i_Value )
  {
    IVideoAttributes Store;
    Store.Set( i_rKey, i_Value );
    return Store;
  }

  template < typename T > using Limits = std::numeric_limits< T >;
} // namespace

// One extreme value of each type, in the order of the type tags, through the serial form bit for
// bit (the sign of zero too); asked for as another type, a value reads as absent.
TEST( AttributeTypes, EveryValueSurvivesTheSerialFormInItsOwnTypeOnly )
{
  const auto Values =
      std::make_tuple( true, Limits< std::int8_t >::min(), Limits< std::int16_t >::min(), Limits< std::int32_t >::min(),
                       Limits< std::int64_t >::min(), Limits< std::uint8_t >::max(), Limits< std::uint16_t >::max(),
                       Limits< std::uint32_t >::max(), Limits< std::uint64_t >::max(), -0.0f,
                       -Limits< double >::denorm_min(), std::string( 70000, '\0' ) + "\xff" );
  IVideoAttributes Store;
  std::uint32_t Tag = 0;
  std::apply( [&]( const auto&... i_rValues ) { ( Store.Set( std::to_string( Tag++ ), i_rValues ), ... ); }, Values );
  IVideoAttributes Read;
  ASSERT_TRUE( ReadBytes( Read, Serialise( Store ), false ) ); // a stream that cannot tell its size
  Tag = 0;
  const auto Check = [&]( const auto& i_rWritten )
  {
    using T = std::decay_t< decltype( i_rWritten ) >;
    const std::string Key = std::to_string( Tag );
    T Value{};
    std::uint32_t Type = 99;
    EXPECT_TRUE( Read.Get( Key, Value ) && Read.GetType( Key, Type ) ) << Key;
    EXPECT_EQ( Tag++, Type );
    if constexpr( std::is_same_v< T, std::string > )
      EXPECT_EQ( i_rWritten, Value );
    else
      EXPECT_EQ( 0, std::memcmp( &Value, &i_rWritten, sizeof( T ) ) ) << Key;
    std::int32_t AsInt = 7;
    EXPECT_EQ( (std::is_same_v< T, std::int32_t >), Read.Get( Key, AsInt ) ) << Key;
  };
  std::apply( [&]( const auto&... i_rValues ) { ( Check( i_rValues ), ... ); }, Values );
}

// The serial form, against bytes written by hand.
TEST( AttributeSerialForm, MatchesTheByteLayoutInKeyOrder )
{
  IVideoAttributes Store;
  Store.Set( "b", std::uint16_t( 0x1234 ) );
  Store.Set( "ab", true );
  Store.Set( "a", "xy" );
  Store.Set( "", -1.5f ); // an empty key is legal
  Store.Set( "c", std::int64_t( -2 ) );
  Store.Set( "d", -2.0 );
  Store.Set( "\xc3", std::int8_t( 90 ) ); // keys sort as unsigned bytes: after every ASCII key
  VBytes Expected;
  Expected.U32( 7 );
  Expected.Text( "" ).U32( 9 ).Raw( { 0x00, 0x00, 0xC0, 0xBF } );
  Expected.Text( "a" ).U32( 11 ).Text( "xy" );
  Expected.Text( "ab" ).U32( 0 ).Raw( { 0x01 } );
  Expected.Text( "b" ).U32( 6 ).Raw( { 0x34, 0x12 } );
  Expected.Text( "c" ).U32( 4 ).Raw( { 0xFE, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF } );
  Expected.Text( "d" ).U32( 10 ).Raw( { 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0x00, 0xC0 } );
  Expected.Text( "\xc3" ).U32( 1 ).Raw( { 90 } );
  EXPECT_EQ( Expected.Data, Serialise( Store ) );
  IVideoAttributes Read;
  ASSERT_TRUE( ReadBytes( Read, Expected.Data, true ) );
  EXPECT_TRUE( Read == Store );
}

// Bytes the writer never makes but the reader takes: no entries, keys out of order with a later
// duplicate winning, a bool byte other than one (written back as one).
TEST( AttributeSerialForm, ReaderTakesWhatTheWriterNeverMakes )
{
  IVideoAttributes Store = One( "stale", 1 );
  ASSERT_TRUE( ReadBytes( Store, VBytes().U32( 0 ).Data, true ) );
  EXPECT_TRUE( Store.Empty() );
  VBytes Unordered;
  Unordered.U32( 3 ).Text( "z" ).U32( 3 ).U32( 1 ).Text( "a" ).U32( 3 ).U32( 2 ).Text( "z" ).U32( 7 ).U32( 3 );
  ASSERT_TRUE( ReadBytes( Store, Unordered.Data, true ) );
  IVideoAttributes Expected = One( "a", 2 );
  Expected.Set( "z", 3u );
  EXPECT_TRUE( Store == Expected );
  ASSERT_TRUE( ReadBytes( Store, VBytes().U32( 1 ).Text( "b" ).U32( 0 ).Raw( { 0x7F } ).Data, true ) );
  EXPECT_TRUE( Store == One( "b", true ) );
  EXPECT_EQ( 0x01, Serialise( Store ).back() );
}

// Malformed input, from a seekable and a forward-only stream.
TEST( AttributeMalformed, EveryCutKeepsExactlyTheEntriesBeforeIt )
{
  IVideoAttributes Store;
  Store.Set( "Bool", true );
  Store.Set( "Double", 2.5 );
  Store.Set( "Int8", std::int8_t( -3 ) );
  Store.Set( "String", "Bayer" );
  Store.Set( "UInt64", std::uint64_t( 1 ) << 40 );
  const std::vector< std::uint8_t > Bytes = Serialise( Store );

  // Where each entry ends in the serial form, by hand: a count, then per entry the key's length,
  // the key, the type tag and the value.
  const std::size_t EntryEnds[] = { 4 + 13, 17 + 22, 39 + 13, 52 + 23, 75 + 22 };
  ASSERT_EQ( 97u, Bytes.size() );

  for( bool bSeekable : { true, false } )
    for( std::size_t Cut = 0; Cut < Bytes.size(); ++Cut )
    {
      SCOPED_TRACE( ( bSeekable ? "seekable, cut at " : "forward only, cut at " ) + std::to_string( Cut ) );
      IVideoAttributes Read;
      EXPECT_FALSE( ReadBytes( Read, std::vector< std::uint8_t >( Bytes.begin(), Bytes.begin() + Cut ), bSeekable ) );
      EXPECT_EQ( std::upper_bound( std::begin( EntryEnds ), std::end( EntryEnds ), Cut ) - EntryEnds, Read.Size() );
      EXPECT_TRUE( Store.ContainsAllOf( Read ) );
    }
}

TEST( AttributeMalformed, UnknownTagOrHugeLengthsFailKeepingWhatCameBeforeAndAllocatingNothingLarge )
{
  const struct
  {
    const char* Name;
    std::vector< std::uint8_t > Bytes;
    std::size_t Kept; // entries read before the fault
  } Cases[] = {
      { "unknown tag", VBytes().U32( 2 ).Text( "first" ).U32( 3 ).U32( 42 ).Text( "second" ).U32( 12 ).U32( 0 ).Data,
        1 },
      { "key length", VBytes().U32( 1 ).U32( 0xFFFFFFF0u ).Raw( { 'a', 'b', 'c' } ).Data, 0 },
      { "string length", VBytes().U32( 1 ).Text( "k" ).U32( 11 ).U32( 0xFFFFFFFFu ).Raw( { 'a' } ).Data, 0 },
      { "entry count", VBytes().U32( 0xFFFFFFFFu ).Text( "k" ).U32( 5 ).Raw( { 1 } ).Data, 1 },
      { "key length of a later entry",
        VBytes().U32( 2 ).Text( "k" ).U32( 5 ).Raw( { 1 } ).U32( 0x80000000u ).Raw( { 'x' } ).Data, 1 },
  };
  for( bool bSeekable : { true, false } )
    for( const auto& rCase : Cases )
    {
      SCOPED_TRACE( std::string( bSeekable ? "seekable, " : "forward only, " ) + rCase.Name );
      IVideoAttributes Store;
      LumekTest::VAllocationWatch Watch;
      EXPECT_FALSE( ReadBytes( Store, rCase.Bytes, bSeekable ) );
      // The bounded reader never asks for more than one chunk beyond what the stream held.
      EXPECT_LT( Watch.Largest(), 1u << 20 );
      EXPECT_EQ( rCase.Kept, Store.Size() );
    }
}

// Text access, for the properties panel and tag import.
// The panel shows a value in the default stream form (numbers, never characters), and what it
// shows parses back to an equal value; other text parses in the key's own type or, when it does
// not fit, keeps the old value and its type.
TEST( AttributeText, ShownTextParsesBackAndOtherTextParsesInTheKeysOwnType )
{
  const struct
  {
    IVideoAttributes Store;
    const char* Shown;
    const char* Input;
    bool Parsed;
    const char* After;
  } Cases[] = { { One( "K", true ), "1", "yes", false, "1" },
                { One( "K", false ), "0", "1", true, "1" },
                { One( "K", std::int8_t( 65 ) ), "65", "-100", true, "-100" },
                { One( "K", std::int8_t( -128 ) ), "-128", "-129", false, "-128" },
                { One( "K", std::uint8_t( 200 ) ), "200", "256", false, "200" },
                { One( "K", 5 ), "5", "12abc", false, "5" },
                { One( "K", 1u ), "1", "4294967296", false, "1" },
                { One( "K", 1u ), "1", "4000000000", true, "4000000000" },
                { One( "K", 1u ), "1", "-1", false, "1" },
                { One( "K", std::uint16_t( 3 ) ), "3", "-0", false, "3" },
                { One( "K", std::uint64_t( 2 ) ), "2", " -1", false, "2" },
                { One( "K", std::int64_t( -9000000000 ) ), "-9000000000", "1", true, "1" },
                { One( "K", ~std::uint64_t( 0 ) ), "18446744073709551615", "18446744073709551616", false,
                  "18446744073709551615" },
                { One( "K", 0.5f ), "0.5", "", false, "0.5" },
                { One( "K", 1e300 ), "1e+300", "2.25", true, "2.25" },
                { One( "K", " Bayer GB8 " ), " Bayer GB8 ", "12 monkeys", true, "12 monkeys" } };
  for( const auto& rCase : Cases )
  {
    SCOPED_TRACE( std::string( rCase.Shown ) + " <- " + rCase.Input );
    std::string Text = "untouched";
    ASSERT_TRUE( rCase.Store.GetValueAsString( "K", Text ) );
    EXPECT_EQ( rCase.Shown, Text );
    IVideoAttributes Store = rCase.Store;
    EXPECT_EQ( rCase.Parsed, Store.SetValueFromString( "K", rCase.Input ) );
    ASSERT_TRUE( Store.GetValueAsString( "K", Text ) );
    EXPECT_EQ( rCase.After, Text );
    ASSERT_TRUE( Store.SetValueFromString( "K", rCase.Shown ) );
    EXPECT_TRUE( Store == rCase.Store ) << "the text parses back in the key's own type";
  }

  // A missing key shows nothing and takes no text.
  IVideoAttributes Store;
  std::string Text = "kept";
  EXPECT_FALSE( Store.GetValueAsString( "K", Text ) || Store.SetValueFromString( "K", "1" ) || Store.Has( "K" ) );
  EXPECT_EQ( "kept", Text );

  // Copies share values; a change through one copy must not show in the other.
  const IVideoAttributes Original = One( "K", 1 );
  IVideoAttributes Copy = Original;
  ASSERT_TRUE( Copy.SetValueFromString( "K", "2" ) );
  EXPECT_TRUE( Original == One( "K", 1 ) );
  Copy.Set( "K", 3 );
  EXPECT_TRUE( Original == One( "K", 1 ) );
}

// Values compare by type and value: the same number in another width or signedness differs, NaN
// differs from itself, and zero equals negative zero. Containment is one-sided.
TEST( AttributeStore, ComparesTypeAndValue )
{
  const double NaN = std::numeric_limits< double >::quiet_NaN();
  EXPECT_FALSE( One( "K", std::int32_t( 1 ) ) == One( "K", std::int64_t( 1 ) ) );
  EXPECT_FALSE( One( "K", std::int32_t( 1 ) ) == One( "K", std::uint32_t( 1 ) ) );
  EXPECT_FALSE( One( "K", NaN ) == One( "K", NaN ) );
  EXPECT_TRUE( One( "K", 0.0f ) == One( "K", -0.0f ) );
  EXPECT_FALSE( One( "A", 1 ) == One( "B", 1 ) );
  EXPECT_FALSE( One( "K", std::string( "a\0b", 3 ) ) == One( "K", std::string( "a\0c", 3 ) ) );
  IVideoAttributes Two = One( "A", 1 ), Small = One( "B", 1 );
  Two.Set( "B", 1 );
  EXPECT_FALSE( One( "A", 1 ) == Two || Two == One( "A", 1 ) );
  EXPECT_TRUE( Two.ContainsAllOf( Small ) && Two.ContainsAllOf( IVideoAttributes() ) );
  EXPECT_FALSE( Small.ContainsAllOf( Two ) );
  Small.Set( "B", 2 );
  EXPECT_FALSE( Two.ContainsAllOf( Small ) );
}

// The attribute fuzzer's seeds are the serial form of a few typical stores. They are kept as
// files beside the fuzzer, and this test holds them to the writer: a change of the binary form
// shows here as a changed golden file. Run with LUMEK_UPDATE_SEEDS=1 to write them afresh.
namespace
{
  IVideoAttributes RecordingStore()
  {
    IVideoAttributes Store;
    IVideoFrameInfo Frame = LumekTest::Frame( 1280, 1024, PixelFormat_BayerGB8 );
    Frame.TwiceOffsetX = 3;
    WriteVideoFrameInfo( Store, Frame );
    WriteAudioFrameInfo( Store, "", { AudioSampleFormat_Int24, 48000, 2 } );
    WriteVideoTiming( Store, { 135000000, 1125000, 0 } );
    WriteVideoSettings( Store, "", { 1.0f, 2.2f } );
    WriteTimecode( Store, { TimecodeStandard_29_97_DF, 10, 1, 0, 2, 7, 0, 0, 1126125 } );
    WriteCameraHardware( Store, { "urn:lumek:cam:1", "1", "V5", "Vantage 5", 2048, 2048, 1.0 } );
    return Store;
  }

  IVideoAttributes HistoryStore()
  {
    IVideoAttributes Store;
    VConversionRecord Record;
    Record.Container = VideoContainer_MOV;
    Record.VideoPayload = VideoPayload_VideoH264;
    Record.PixelFormat = PixelFormat_PlanarY8U8V8;
    Record.LensDistortionCalibration = LumekTest::Lens( RadialModel_Lumek3Parameter, { -0.1, 0.01, 0.0 } );
    WriteConversionRecords( Store, { Record, VConversionRecord() } );
    WriteLensDistortionCalibration( Store, "",
                                    LumekTest::Lens( RadialModel_Lumek2Parameter, { 0.2, -0.05 }, 640, 512 ) );
    return Store;
  }

  IVideoAttributes EveryTypeStore()
  {
    IVideoAttributes Store;
    Store.Set( "", false );
    Store.Set( "i8", std::int8_t( -1 ) );
    Store.Set( "i16", std::int16_t( -300 ) );
    Store.Set( "i32", std::int32_t( -70000 ) );
    Store.Set( "i64", std::int64_t( -5000000000 ) );
    Store.Set( "u8", std::uint8_t( 255 ) );
    Store.Set( "u16", std::uint16_t( 65535 ) );
    Store.Set( "u32", std::uint32_t( 4000000000u ) );
    Store.Set( "u64", std::uint64_t( 1 ) << 63 );
    Store.Set( "f32", 0.1f );
    Store.Set( "f64", -1e-10 );
    Store.Set( "str", std::string( "a\0b", 3 ) );
    return Store;
  }
} // namespace

TEST( AttributeSeeds, EachSeedFileIsTheWritersOutput )
{
  const std::pair< const char*, IVideoAttributes > Seeds[] = {
      { "recording", RecordingStore() }, { "history", HistoryStore() }, { "everytype", EveryTypeStore() } };
  for( const auto& [pName, Store] : Seeds )
  {
    const std::string Path = std::string( LUMEK_SOURCE_DIR ) + "/fuzz/seeds/attributes/" + pName + ".bin";
    SCOPED_TRACE( Path );
    const std::vector< std::uint8_t > Expected = LumekTest::Serialise( Store );
    if( std::getenv( "LUMEK_UPDATE_SEEDS" ) != nullptr )
      std::ofstream( Path, std::ios::binary ) << std::string( Expected.begin(), Expected.end() );
    std::ifstream In( Path, std::ios::binary );
    ASSERT_TRUE( In );
    const std::vector< std::uint8_t > Stored( ( std::istreambuf_iterator< char >( In ) ),
                                              std::istreambuf_iterator< char >() );
    EXPECT_EQ( Expected, Stored );
    UtilsIO::VMemoryInputStream Input( Stored.data(), Stored.size() );
    IVideoAttributes Read;
    ASSERT_TRUE( Read.ReadFrom( Input ) );
    EXPECT_TRUE( Read == Store );
  }
}
