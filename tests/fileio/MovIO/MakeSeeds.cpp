// Writes the MOV fuzz target's seeds: mov_make_seeds <folder>. Small files of the shapes the
// reader accepts, so that the fuzzer starts past the first checks of every atom.

#include "MovTestSupport.h"

#include <fstream>
#include <functional>
#include <iostream>
#include <string>

int main( int i_Count, char** i_ppArguments )
{
  if( i_Count != 2 )
  {
    std::cerr << "usage: mov_make_seeds FOLDER\n";
    return 1;
  }
  const std::pair< const char*, std::function< void( MovTest::VMovSpec& ) > > Seeds[] = {
      { "plain.mov", []( MovTest::VMovSpec& ) {} },
      { "audio-timecode.mov",
        []( MovTest::VMovSpec& s )
        {
          s.AudioRate = 8000;
          s.TimecodeFrame = 1234;
          s.SamplesPerChunk = 2;
        } },
      { "large-mdat-co64.mov",
        []( MovTest::VMovSpec& s )
        {
          s.bLargeMdatFirst = true;
          s.bCo64Only = true;
          s.bTwoMdiaFirstEmpty = true;
        } },
  };
  for( const auto& rSeed : Seeds )
  {
    MovTest::VMovSpec Spec;
    Spec.Width = 8;
    Spec.Height = 4;
    Spec.Frames = 3;
    rSeed.second( Spec );
    const std::vector< std::uint8_t > Bytes = MovTest::WriteMov( Spec );
    std::ofstream Out( std::string( i_ppArguments[1] ) + "/" + rSeed.first, std::ios::binary );
    Out.write( reinterpret_cast< const char* >( Bytes.data() ), static_cast< std::streamsize >( Bytes.size() ) );
  }
  return 0;
}
