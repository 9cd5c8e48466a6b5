#include "videointerface/IVideoAttributes.h"

#include "tests/support/AllocationWatch.h"
#include "tests/support/TestNames.h"
#include "utils/MemoryStream.h"

#include <gtest/gtest.h>

#include <cmath>
#include <cstring>
#include <limits>

using ZOL::IVideoAttributes;

namespace
{
  std::vector< std::uint8_t > Serialise( const IVideoAttributes& i_rStore )
  {
    UtilsIO::VMemoryStream Stream;
    EXPECT_TRUE( i_rStore.WriteTo( Stream ) );
    return Stream.GetData();
  }

  // A stream that cannot tell its size, as a socket or a pipe would be: ReadFrom has to guard
  // against lying lengths without asking.
  class VForwardOnlyStream : public ZOL::IInputStream
  {
  public:
    explicit VForwardOnlyStream( const std::vector< std::uint8_t >& i_rData ) : m_rData( i_rData ) {}
    bool Read( void* o_pBuffer, std::uint64_t i_Size ) override
    {
      if( i_Size > m_rData.size() - m_Position )
      {
        m_Position = m_rData.size();
        m_bAtEnd = true;
        return false;
      }
      if( i_Size != 0 )
        std::memcpy( o_pBuffer, m_rData.data() + m_Position, static_cast< std::size_t >( i_Size ) );
      m_Position += static_cast< std::size_t >( i_Size );
      return true;
    }
    bool IsAtEnd() override { return m_bAtEnd; }

  private:
    const std::vector< std::uint8_t >& m_rData;
    std::size_t m_Position = 0;
    bool m_bAtEnd = false;
  };

  enum class EStreamKind
  {
    Seekable,
    ForwardOnly
  };

  bool ReadBytes( IVideoAttributes& o_rStore, const std::vector< std::uint8_t >& i_rBytes, EStreamKind i_Kind )
  {
    if( i_Kind == EStreamKind::Seekable )
    {
      UtilsIO::VMemoryInputStream Stream( i_rBytes.data(), i_rBytes.size() );
      return o_rStore.ReadFrom( Stream );
    }
    VForwardOnlyStream Stream( i_rBytes );
    return o_rStore.ReadFrom( Stream );
  }

  std::string KindName( const testing::TestParamInfo< EStreamKind >& i_rInfo )
  {
    return i_rInfo.param == EStreamKind::Seekable ? "Seekable" : "ForwardOnly";
  }

  // Little-endian bytes written by hand, independent of the code under test.
  struct VBytes
  {
    std::vector< std::uint8_t > Data;
    VBytes& U32( std::uint32_t i_Value )
    {
      for( int i = 0; i < 4; ++i )
        Data.push_back( static_cast< std::uint8_t >( i_Value >> ( 8 * i ) ) );
      return *this;
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
} // namespace

// ---------------------------------------------------------------------------------------------
// Every value type through Set, Get, GetType and the serial form.

template < typename T > struct VTypeCase;

#define LUMEK_TYPE_CASE( TYPE, TAG, ... )                                                                              \
  template <> struct VTypeCase< TYPE >                                                                                 \
  {                                                                                                                    \
    static constexpr std::uint32_t Tag = TAG;                                                                          \
    static std::vector< TYPE > Values() { return { __VA_ARGS__ }; }                                                    \
  };

template < typename T > using Limits = std::numeric_limits< T >;

LUMEK_TYPE_CASE( bool, 0, false, true )
LUMEK_TYPE_CASE( std::int8_t, 1, 0, -1, Limits< std::int8_t >::min(), Limits< std::int8_t >::max() )
LUMEK_TYPE_CASE( std::int16_t, 2, 0, -2, Limits< std::int16_t >::min(), Limits< std::int16_t >::max() )
LUMEK_TYPE_CASE( std::int32_t, 3, 0, -3, Limits< std::int32_t >::min(), Limits< std::int32_t >::max() )
LUMEK_TYPE_CASE( std::int64_t, 4, 0, -4, Limits< std::int64_t >::min(), Limits< std::int64_t >::max() )
LUMEK_TYPE_CASE( std::uint8_t, 5, 0, 1, 0x80, Limits< std::uint8_t >::max() )
LUMEK_TYPE_CASE( std::uint16_t, 6, 0, 1, 0x8000, Limits< std::uint16_t >::max() )
LUMEK_TYPE_CASE( std::uint32_t, 7, 0, 1, 0x80000000u, Limits< std::uint32_t >::max() )
LUMEK_TYPE_CASE( std::uint64_t, 8, 0, 1, 0x8000000000000000ull, Limits< std::uint64_t >::max() )
LUMEK_TYPE_CASE( float, 9, 0.0f, -0.5f, 1e-38f, Limits< float >::max(), Limits< float >::infinity(),
                 Limits< float >::denorm_min() )
LUMEK_TYPE_CASE( double, 10, 0.0, -0.1, 1e-300, Limits< double >::max(), -Limits< double >::infinity(),
                 Limits< double >::denorm_min() )
LUMEK_TYPE_CASE( std::string, 11, "", "Luminance8", std::string( "a\0b", 3 ), std::string( 70000, 'x' ), "\xff\xfe" )

template < typename T > class AttributeTypeTest : public testing::Test
{
};

using AllValueTypes = testing::Types< bool, std::int8_t, std::int16_t, std::int32_t, std::int64_t, std::uint8_t,
                                      std::uint16_t, std::uint32_t, std::uint64_t, float, double, std::string >;
TYPED_TEST_SUITE( AttributeTypeTest, AllValueTypes );

TYPED_TEST( AttributeTypeTest, EveryValueSurvivesTheSerialForm )
{
  IVideoAttributes Store;
  const auto Values = VTypeCase< TypeParam >::Values();
  for( std::size_t i = 0; i < Values.size(); ++i )
    Store.Set( "Key." + std::to_string( i ), Values[i] );

  const std::vector< std::uint8_t > Bytes = Serialise( Store );
  for( EStreamKind Kind : { EStreamKind::Seekable, EStreamKind::ForwardOnly } )
  {
    IVideoAttributes Read;
    ASSERT_TRUE( ReadBytes( Read, Bytes, Kind ) );
    EXPECT_TRUE( Read == Store );
    for( std::size_t i = 0; i < Values.size(); ++i )
    {
      const std::string Key = "Key." + std::to_string( i );
      TypeParam Value{};
      ASSERT_TRUE( Read.Get( Key, Value ) ) << Key;
      if constexpr( std::is_floating_point_v< TypeParam > )
        EXPECT_EQ( 0, std::memcmp( &Value, &Values[i], sizeof( Value ) ) ) << Key; // bit for bit, sign of zero too
      else
        EXPECT_EQ( Value, Values[i] ) << Key;
      std::uint32_t Type = 99;
      ASSERT_TRUE( Read.GetType( Key, Type ) );
      EXPECT_EQ( VTypeCase< TypeParam >::Tag, Type );
    }
  }
}

TYPED_TEST( AttributeTypeTest, OnlyTheExactStoredTypeReads )
{
  // No numeric conversion: any other type asked for reads as absent and keeps the output.
  IVideoAttributes Store;
  Store.Set( "K", VTypeCase< TypeParam >::Values().back() );
  auto ExpectAbsentAs = [&]( auto i_Sentinel )
  {
    using Asked = decltype( i_Sentinel );
    if constexpr( !std::is_same_v< Asked, TypeParam > )
    {
      Asked Value = i_Sentinel;
      EXPECT_FALSE( Store.Get( "K", Value ) ) << typeid( Asked ).name();
      EXPECT_TRUE( Value == i_Sentinel );
    }
  };
  ExpectAbsentAs( true );
  ExpectAbsentAs( std::int8_t( 7 ) );
  ExpectAbsentAs( std::int16_t( 7 ) );
  ExpectAbsentAs( std::int32_t( 7 ) );
  ExpectAbsentAs( std::int64_t( 7 ) );
  ExpectAbsentAs( std::uint8_t( 7 ) );
  ExpectAbsentAs( std::uint16_t( 7 ) );
  ExpectAbsentAs( std::uint32_t( 7 ) );
  ExpectAbsentAs( std::uint64_t( 7 ) );
  ExpectAbsentAs( 7.0f );
  ExpectAbsentAs( 7.0 );
  ExpectAbsentAs( std::string( "seven" ) );
}

// ---------------------------------------------------------------------------------------------
// The serial form, against bytes written by hand.

TEST( AttributeSerialForm, MatchesTheByteLayoutInKeyOrder )
{
  IVideoAttributes Store;
  Store.Set( "b", std::uint16_t( 0x1234 ) );
  Store.Set( "ab", true );
  Store.Set( "a", "xy" );
  Store.Set( "", -1.5f );
  Store.Set( "c", std::int64_t( -2 ) );

  VBytes Expected;
  Expected.U32( 5 );
  Expected.Text( "" ).U32( 9 ).Raw( { 0x00, 0x00, 0xC0, 0xBF } );
  Expected.Text( "a" ).U32( 11 ).Text( "xy" );
  Expected.Text( "ab" ).U32( 0 ).Raw( { 0x01 } );
  Expected.Text( "b" ).U32( 6 ).Raw( { 0x34, 0x12 } );
  Expected.Text( "c" ).U32( 4 ).Raw( { 0xFE, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF, 0xFF } );
  EXPECT_EQ( Expected.Data, Serialise( Store ) );
}

TEST( AttributeSerialForm, KeysSortAsUnsignedBytesShorterFirst )
{
  IVideoAttributes Store;
  for( const char* pKey : { "\xc3\xa9t\xc3\xa9", "z", "Z", "aa", "a", "a\x01" } )
    Store.Set( pKey, 1 );
  std::vector< std::string > Keys;
  Store.GetKeys( Keys );
  const std::vector< std::string > Expected = { "Z", "a", "a\x01", "aa", "z", "\xc3\xa9t\xc3\xa9" };
  EXPECT_EQ( Expected, Keys );
}

TEST( AttributeSerialForm, ZeroCountIsAnEmptyStore )
{
  IVideoAttributes Store;
  Store.Set( "stale", 1 );
  const std::vector< std::uint8_t > Bytes = VBytes().U32( 0 ).Data;
  EXPECT_TRUE( ReadBytes( Store, Bytes, EStreamKind::Seekable ) );
  EXPECT_TRUE( Store.Empty() );
}

TEST( AttributeSerialForm, ReaderDoesNotRequireKeyOrderAndLaterDuplicateWins )
{
  VBytes Bytes;
  Bytes.U32( 3 );
  Bytes.Text( "z" ).U32( 3 ).U32( 1 );
  Bytes.Text( "a" ).U32( 3 ).U32( 2 );
  Bytes.Text( "z" ).U32( 7 ).U32( 3 );
  IVideoAttributes Store;
  ASSERT_TRUE( ReadBytes( Store, Bytes.Data, EStreamKind::Seekable ) );
  EXPECT_EQ( 2u, Store.Size() );
  std::uint32_t Z = 0;
  EXPECT_TRUE( Store.Get( "z", Z ) );
  EXPECT_EQ( 3u, Z );
}

TEST( AttributeSerialForm, EmptyKeyIsLegal )
{
  IVideoAttributes Store;
  Store.Set( "", std::string( "value" ) );
  IVideoAttributes Read;
  ASSERT_TRUE( ReadBytes( Read, Serialise( Store ), EStreamKind::Seekable ) );
  std::string Value;
  EXPECT_TRUE( Read.Get( "", Value ) );
  EXPECT_EQ( "value", Value );
}

TEST( AttributeSerialForm, NonZeroBoolByteReadsAsTrueAndWritesBackAsOne )
{
  VBytes Bytes;
  Bytes.U32( 1 ).Text( "b" ).U32( 0 ).Raw( { 0x7F } );
  IVideoAttributes Store;
  ASSERT_TRUE( ReadBytes( Store, Bytes.Data, EStreamKind::Seekable ) );
  bool bValue = false;
  EXPECT_TRUE( Store.Get( "b", bValue ) );
  EXPECT_TRUE( bValue );
  EXPECT_EQ( 0x01, Serialise( Store ).back() );
}

// ---------------------------------------------------------------------------------------------
// Malformed input.

class AttributeMalformedTest : public testing::TestWithParam< EStreamKind >
{
};

TEST_P( AttributeMalformedTest, EveryCutKeepsExactlyTheEntriesBeforeIt )
{
  IVideoAttributes Store;
  Store.Set( "Bool", true );
  Store.Set( "Double", 2.5 );
  Store.Set( "Int8", std::int8_t( -3 ) );
  Store.Set( "String", "Bayer" );
  Store.Set( "UInt64", std::uint64_t( 1 ) << 40 );
  const std::vector< std::uint8_t > Bytes = Serialise( Store );

  // Where each entry ends in the serial form, computed from the layout rather than the reader.
  std::vector< std::size_t > EntryEnds;
  std::size_t End = 4;
  for( const auto& rEntry : Store.GetMap() )
  {
    UtilsIO::VMemoryStream Value;
    ASSERT_TRUE( rEntry.second->Write( Value ) );
    End += 4 + rEntry.first.size() + Value.GetData().size();
    EntryEnds.push_back( End );
  }
  ASSERT_EQ( Bytes.size(), End );

  for( std::size_t Cut = 0; Cut < Bytes.size(); ++Cut )
  {
    const std::vector< std::uint8_t > Short( Bytes.begin(), Bytes.begin() + Cut );
    IVideoAttributes Read;
    EXPECT_FALSE( ReadBytes( Read, Short, GetParam() ) ) << "cut at " << Cut;
    const std::size_t Complete = std::upper_bound( EntryEnds.begin(), EntryEnds.end(), Cut ) - EntryEnds.begin();
    EXPECT_EQ( Complete, Read.Size() ) << "cut at " << Cut;
    EXPECT_TRUE( Store.ContainsAllOf( Read ) ) << "cut at " << Cut;
  }
}

TEST_P( AttributeMalformedTest, UnknownTagStopsAndKeepsWhatCameBefore )
{
  VBytes Bytes;
  Bytes.U32( 2 ).Text( "first" ).U32( 3 ).U32( 42 ).Text( "second" ).U32( 12 ).U32( 0 );
  IVideoAttributes Store;
  EXPECT_FALSE( ReadBytes( Store, Bytes.Data, GetParam() ) );
  EXPECT_EQ( 1u, Store.Size() );
  std::int32_t First = 0;
  EXPECT_TRUE( Store.Get( "first", First ) );
  EXPECT_EQ( 42, First );
}

struct VHugeLengthCase
{
  const char* Name;
  std::vector< std::uint8_t > Bytes;
};

TEST_P( AttributeMalformedTest, HugeClaimedLengthsFailWithoutAllocatingThem )
{
  const std::vector< VHugeLengthCase > Cases = {
      { "key length", VBytes().U32( 1 ).U32( 0xFFFFFFF0u ).Raw( { 'a', 'b', 'c' } ).Data },
      { "string length", VBytes().U32( 1 ).Text( "k" ).U32( 11 ).U32( 0xFFFFFFFFu ).Raw( { 'a' } ).Data },
      { "entry count", VBytes().U32( 0xFFFFFFFFu ).Text( "k" ).U32( 5 ).Raw( { 1 } ).Data },
      { "key length of a later entry",
        VBytes().U32( 2 ).Text( "k" ).U32( 5 ).Raw( { 1 } ).U32( 0x80000000u ).Raw( { 'x' } ).Data },
  };
  for( const VHugeLengthCase& rCase : Cases )
  {
    IVideoAttributes Store;
    LumekTest::VAllocationWatch Watch;
    EXPECT_FALSE( ReadBytes( Store, rCase.Bytes, GetParam() ) ) << rCase.Name;
    // The bounded reader never asks for more than one chunk beyond what the stream held.
    EXPECT_LT( Watch.Largest(), 1u << 20 ) << rCase.Name;
  }
}

INSTANTIATE_TEST_SUITE_P( Streams, AttributeMalformedTest,
                          testing::Values( EStreamKind::Seekable, EStreamKind::ForwardOnly ), KindName );

// ---------------------------------------------------------------------------------------------
// Text access, for the properties panel and tag import.

struct VValueTextCase
{
  const char* Name;
  std::function< void( IVideoAttributes& ) > Store;
  const char* Text;
};

class AttributeTextTest : public testing::TestWithParam< VValueTextCase >
{
};

TEST_P( AttributeTextTest, ValueShowsInTheDefaultStreamForm )
{
  IVideoAttributes Store;
  GetParam().Store( Store );
  std::string Text = "untouched";
  ASSERT_TRUE( Store.GetValueAsString( "K", Text ) );
  EXPECT_EQ( GetParam().Text, Text );

  // What the panel shows parses back, in the same type, to an equal value.
  IVideoAttributes Parsed;
  GetParam().Store( Parsed );
  ASSERT_TRUE( Parsed.SetValueFromString( "K", "0" ) );
  EXPECT_FALSE( GetParam().Text != std::string( "0" ) && Parsed == Store );
  ASSERT_TRUE( Parsed.SetValueFromString( "K", Text ) );
  EXPECT_TRUE( Parsed == Store );
}

INSTANTIATE_TEST_SUITE_P(
    Types, AttributeTextTest,
    testing::Values(
        VValueTextCase{ "BoolAsNumber", []( IVideoAttributes& s ) { s.Set( "K", true ); }, "1" },
        VValueTextCase{ "Int8AsNumberNotCharacter", []( IVideoAttributes& s ) { s.Set( "K", std::int8_t( 65 ) ); },
                        "65" },
        VValueTextCase{ "NegativeInt8", []( IVideoAttributes& s ) { s.Set( "K", std::int8_t( -128 ) ); }, "-128" },
        VValueTextCase{ "UInt8AsNumberNotCharacter", []( IVideoAttributes& s ) { s.Set( "K", std::uint8_t( 200 ) ); },
                        "200" },
        VValueTextCase{ "Int64", []( IVideoAttributes& s ) { s.Set( "K", std::int64_t( -9000000000 ) ); },
                        "-9000000000" },
        VValueTextCase{ "UInt64Max", []( IVideoAttributes& s ) { s.Set( "K", ~std::uint64_t( 0 ) ); },
                        "18446744073709551615" },
        VValueTextCase{ "FloatDefaultPrecision", []( IVideoAttributes& s ) { s.Set( "K", 0.5f ); }, "0.5" },
        VValueTextCase{ "DoubleScientific", []( IVideoAttributes& s ) { s.Set( "K", 1e300 ); }, "1e+300" },
        VValueTextCase{ "StringUnchanged", []( IVideoAttributes& s ) { s.Set( "K", " Bayer GB8 " ); },
                        " Bayer GB8 " } ),
    LumekTest::VCaseName() );

TEST( AttributeText, AbsentKeyGivesNoText )
{
  IVideoAttributes Store;
  std::string Text = "kept";
  EXPECT_FALSE( Store.GetValueAsString( "K", Text ) );
  EXPECT_EQ( "kept", Text );
  EXPECT_FALSE( Store.SetValueFromString( "K", "1" ) );
  EXPECT_FALSE( Store.Has( "K" ) );
}

struct VParseCase
{
  const char* Name;
  std::function< void( IVideoAttributes& ) > Store;
  const char* Text;
  bool Parsed;
  const char* After; // the panel text of the key afterwards
};

class AttributeParseTest : public testing::TestWithParam< VParseCase >
{
};

TEST_P( AttributeParseTest, TextParsesInTheKeysOwnType )
{
  IVideoAttributes Store;
  GetParam().Store( Store );
  std::uint32_t TypeBefore = 0, TypeAfter = 1;
  Store.GetType( "K", TypeBefore );
  EXPECT_EQ( GetParam().Parsed, Store.SetValueFromString( "K", GetParam().Text ) );
  Store.GetType( "K", TypeAfter );
  EXPECT_EQ( TypeBefore, TypeAfter );
  std::string After;
  ASSERT_TRUE( Store.GetValueAsString( "K", After ) );
  EXPECT_EQ( GetParam().After, After );
}

INSTANTIATE_TEST_SUITE_P(
    Types, AttributeParseTest,
    testing::Values(
        VParseCase{ "UInt32", []( IVideoAttributes& s ) { s.Set( "K", 1u ); }, "4000000000", true, "4000000000" },
        VParseCase{ "UInt32TooLargeKeepsOld", []( IVideoAttributes& s ) { s.Set( "K", 1u ); }, "4294967296", false,
                    "1" },
        VParseCase{ "Int32GarbageKeepsOld", []( IVideoAttributes& s ) { s.Set( "K", 5 ); }, "12abc", false, "5" },
        VParseCase{ "Int16", []( IVideoAttributes& s ) { s.Set( "K", std::int16_t( 0 ) ); }, "-32768", true, "-32768" },
        VParseCase{ "UInt8AsNumber", []( IVideoAttributes& s ) { s.Set( "K", std::uint8_t( 0 ) ); }, "7", true, "7" },
        VParseCase{ "UInt8OutOfRange", []( IVideoAttributes& s ) { s.Set( "K", std::uint8_t( 9 ) ); }, "256", false,
                    "9" },
        VParseCase{ "Int8Negative", []( IVideoAttributes& s ) { s.Set( "K", std::int8_t( 0 ) ); }, "-100", true,
                    "-100" },
        VParseCase{ "BoolFromDigit", []( IVideoAttributes& s ) { s.Set( "K", false ); }, "1", true, "1" },
        VParseCase{ "BoolFromWordKeepsOld", []( IVideoAttributes& s ) { s.Set( "K", false ); }, "yes", false, "0" },
        VParseCase{ "Double", []( IVideoAttributes& s ) { s.Set( "K", 0.0 ); }, "2.25", true, "2.25" },
        VParseCase{ "FloatEmptyKeepsOld", []( IVideoAttributes& s ) { s.Set( "K", 1.5f ); }, "", false, "1.5" },
        VParseCase{ "StringTakesAnything", []( IVideoAttributes& s ) { s.Set( "K", "a" ); }, "12 monkeys", true,
                    "12 monkeys" } ),
    LumekTest::VCaseName() );

TEST( AttributeText, ChangingACopyLeavesTheOriginal )
{
  // Copies share values; a change through one copy must not show in the other.
  IVideoAttributes Original;
  Original.Set( "K", 1 );
  IVideoAttributes Copy = Original;
  ASSERT_TRUE( Copy.SetValueFromString( "K", "2" ) );
  std::int32_t Value = 0;
  Original.Get( "K", Value );
  EXPECT_EQ( 1, Value );
  Copy.Set( "K", 3 );
  Original.Get( "K", Value );
  EXPECT_EQ( 1, Value );
}

// ---------------------------------------------------------------------------------------------
// Comparison.

struct VEqualityCase
{
  const char* Name;
  std::function< void( IVideoAttributes& ) > Left;
  std::function< void( IVideoAttributes& ) > Right;
  bool Equal;
};

class AttributeEqualityTest : public testing::TestWithParam< VEqualityCase >
{
};

TEST_P( AttributeEqualityTest, ComparesTypeAndValue )
{
  IVideoAttributes Left, Right;
  GetParam().Left( Left );
  GetParam().Right( Right );
  EXPECT_EQ( GetParam().Equal, Left == Right );
  EXPECT_EQ( GetParam().Equal, Right == Left );
  EXPECT_EQ( !GetParam().Equal, Left != Right );
}

INSTANTIATE_TEST_SUITE_P(
    Values, AttributeEqualityTest,
    testing::Values(
        VEqualityCase{ "SameIntDifferentWidth", []( IVideoAttributes& s ) { s.Set( "K", std::int32_t( 1 ) ); },
                       []( IVideoAttributes& s ) { s.Set( "K", std::int64_t( 1 ) ); }, false },
        VEqualityCase{ "SignedAgainstUnsigned", []( IVideoAttributes& s ) { s.Set( "K", std::int32_t( 1 ) ); },
                       []( IVideoAttributes& s ) { s.Set( "K", std::uint32_t( 1 ) ); }, false },
        VEqualityCase{ "NaNDiffersFromItself",
                       []( IVideoAttributes& s ) { s.Set( "K", std::numeric_limits< double >::quiet_NaN() ); },
                       []( IVideoAttributes& s ) { s.Set( "K", std::numeric_limits< double >::quiet_NaN() ); }, false },
        VEqualityCase{ "ZeroEqualsNegativeZero", []( IVideoAttributes& s ) { s.Set( "K", 0.0f ); },
                       []( IVideoAttributes& s ) { s.Set( "K", -0.0f ); }, true },
        VEqualityCase{ "DifferentKeys", []( IVideoAttributes& s ) { s.Set( "A", 1 ); },
                       []( IVideoAttributes& s ) { s.Set( "B", 1 ); }, false },
        VEqualityCase{ "ExtraKey", []( IVideoAttributes& s ) { s.Set( "A", 1 ); },
                       []( IVideoAttributes& s )
                       {
                         s.Set( "A", 1 );
                         s.Set( "B", 1 );
                       },
                       false },
        VEqualityCase{ "StringsWithEmbeddedZero", []( IVideoAttributes& s ) { s.Set( "K", std::string( "a\0b", 3 ) ); },
                       []( IVideoAttributes& s ) { s.Set( "K", std::string( "a\0c", 3 ) ); }, false },
        VEqualityCase{ "EmptyStores", []( IVideoAttributes& ) {}, []( IVideoAttributes& ) {}, true } ),
    LumekTest::VCaseName() );

TEST( AttributeStore, ContainsAllOfIsOneSided )
{
  IVideoAttributes Big, Small;
  Big.Set( "A", 1 );
  Big.Set( "B", "x" );
  Small.Set( "B", "x" );
  EXPECT_TRUE( Big.ContainsAllOf( Small ) );
  EXPECT_FALSE( Small.ContainsAllOf( Big ) );
  Small.Set( "B", "y" );
  EXPECT_FALSE( Big.ContainsAllOf( Small ) );
  EXPECT_TRUE( Big.ContainsAllOf( IVideoAttributes() ) );
}
