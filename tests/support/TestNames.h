#pragma once

// The name of a row of a parameterised test, for ctest and gtest's output: every table row
// carries a readable `Name`, so that a failure says which case failed instead of gtest's byte
// dump of the parameter.

#include <gtest/gtest.h>

#include <string>

namespace LumekTest
{
  struct VCaseName
  {
    template < typename T > std::string operator()( const testing::TestParamInfo< T >& i_rInfo ) const
    {
      return std::string( i_rInfo.param.Name );
    }
  };

  // For a test over the rows of a text table: the row's text with everything gtest does not
  // accept in a name dropped.
  inline std::string TextCaseName( const std::string& i_rText )
  {
    std::string Name;
    for( char Char : i_rText )
      if( ( Char >= 'A' && Char <= 'Z' ) || ( Char >= 'a' && Char <= 'z' ) || ( Char >= '0' && Char <= '9' ) )
        Name += Char;
    return Name.empty() ? "Empty" : Name;
  }
} // namespace LumekTest
