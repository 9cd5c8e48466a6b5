// Writes the MOV fuzz target's seeds: mov_make_seeds <folder>. Small files of the shapes the
// reader accepts, so that the fuzzer starts past the first checks of every atom.

#include "MovTestSupport.h"

#include <fstream>
#include <iostream>

int main( int i_Count, char** i_ppArguments )
{
  if( i_Count != 2 )
  {
    std::cerr << "usage: mov_make_seeds FOLDER\n";
    return 1;
  }
  MovTest::VMovSpec Plain;
  Plain.Width = 8;
  Plain.Height = 4;
  Plain.Frames = 3;
  MovTest::VMovSpec AudioTimecode = Plain, LargeMdat = Plain;
  AudioTimecode.AudioRate = 8000;
  AudioTimecode.TimecodeFrame = 1234;
  AudioTimecode.SamplesPerChunk = 2;
  LargeMdat.bLargeMdatFirst = LargeMdat.bCo64Only = LargeMdat.bTwoMdiaFirstEmpty = true;
  for( const auto& rSeed :
       { std::make_pair( "plain.mov", Plain ), std::make_pair( "audio-timecode.mov", AudioTimecode ),
         std::make_pair( "large-mdat-co64.mov", LargeMdat ) } )
  {
    const MovTest::VBytes Bytes = MovTest::WriteMov( rSeed.second );
    std::ofstream( std::string( i_ppArguments[1] ) + "/" + rSeed.first, std::ios::binary )
        .write( reinterpret_cast< const char* >( Bytes.data() ), static_cast< std::streamsize >( Bytes.size() ) );
  }
  return 0;
}
