#include "utils/MemoryStream.h"

#include "videointerface/IBuffer.h"

#include <gtest/gtest.h>

#include <limits>

using UtilsIO::VMemoryInputStream;
using UtilsIO::VMemoryStream;

TEST( MemoryStream, ReadAndWriteShareOnePosition )
{
  VMemoryStream Stream;
  ASSERT_TRUE( Stream.Write( "abcdef", 6 ) && Stream.Seek( 2 ) && Stream.Write( "XY", 2 ) );
  char Text[6] = {};
  ASSERT_TRUE( Stream.Read( Text, 2 ) );
  EXPECT_EQ( "ef", std::string( Text, 2 ) );
  ASSERT_TRUE( ZOL::Skip( Stream, -6 ) && Stream.Read( Text, 6 ) );
  EXPECT_EQ( "abXYef", std::string( Text, 6 ) );
  EXPECT_FALSE( ZOL::Skip( Stream, -7 ) );
  // Writing past the end after a seek fills the gap with zeros.
  ASSERT_TRUE( Stream.Seek( 8 ) && Stream.Write( "!", 1 ) );
  std::uint64_t Size = 0;
  ASSERT_TRUE( Stream.GetSize( Size ) );
  EXPECT_EQ( 9u, Size );
  EXPECT_EQ( 0, Stream.GetData()[6] );
}

TEST( MemoryStream, BlocksStopAtTheFirstFailureAndReadsBeyondTheEndFailWithoutOverrun )
{
  const char Data[] = "0123456789";
  VMemoryInputStream Input( Data, 10 );
  char A[4] = {}, B[8] = {}, C[1] = {};
  EXPECT_TRUE( Input.ReadAll( {} ) );
  EXPECT_FALSE( Input.ReadAll( { { A, 4 }, { B, 8 }, { C, 1 } } ) );
  EXPECT_EQ( "0123", std::string( A, 4 ) );
  EXPECT_EQ( 0, C[0] ) << "the block after the failure is not read";

  VMemoryStream Output;
  ZOL::IStandardBuffer Buffer;
  Buffer.Resize( 3 );
  Buffer.GetData()[0] = 'x';
  EXPECT_TRUE( Output.WriteAll( { { "ab", 2 }, { "", 0 } } ) );
  EXPECT_TRUE( Output.WriteBuffer( Buffer ) );
  EXPECT_EQ( ( std::vector< std::uint8_t >{ 'a', 'b', 'x', 0, 0 } ), Output.GetData() );

  VMemoryInputStream Short( Data, 4 );
  ASSERT_TRUE( Short.Seek( 100 ) );
  EXPECT_FALSE( Short.Read( C, 1 ) );
  ASSERT_TRUE( Short.Seek( 3 ) );
  EXPECT_FALSE( Short.Read( A, std::numeric_limits< std::uint64_t >::max() ) );
  EXPECT_FALSE( Short.Seek( -1 ) );
  EXPECT_TRUE( Short.Read( A, 0 ) );
}
