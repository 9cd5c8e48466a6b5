// Writes small files of the family as the Matroska fuzz target's seeds: mkv_make_seeds <folder>.

#include "tests/fileio/MkvIO/MkvTestSupport.h"

#include <iostream>

int main( int i_ArgumentCount, char** i_ppArguments )
{
  if( i_ArgumentCount != 2 )
  {
    std::cerr << "usage: mkv_make_seeds <folder>\n";
    return 1;
  }
  const std::string Folder = i_ppArguments[1];
  MkvTest::VFamilyCase Case{ ZOL::PixelFormat_U8Y8V8Y8, ZOL::AudioSampleFormat_Int16, false, 4, 2, 2 };
  bool bGood = MkvTest::WriteFamilyFile( Folder + "/uyvy_audio.mkv", Case );
  Case.Format = ZOL::PixelFormat_Luminance8;
  Case.Audio = ZOL::AudioSampleFormat_Unspecified;
  bGood = bGood &&
          MkvTest::WriteFamilyFile( Folder + "/grey_vfw.mkv", Case, {},
                                    []( MkvIO::VMkvDescription& io_rD ) { io_rD.Video.CodecID = "V_MS/VFW/FOURCC"; } );
  // Odd Clusters: a third track, a group without a block, two audio blocks.
  Case.Audio = ZOL::AudioSampleFormat_Float32;
  bGood = bGood && MkvTest::WriteFamilyFile( Folder + "/odd_clusters.mkv", Case, {}, {},
                                             []( int i_Frame )
                                             {
                                               return std::vector< MkvIO::VMkvBlock >{
                                                   { 3, { 1, 2 } },
                                                   { 1, MkvTest::VBytes( 8, 7 ), i_Frame != 0 },
                                                   { 2, MkvTest::VBytes( 8, 1 ) },
                                                   { 2, MkvTest::VBytes( 16, 2 ) } };
                                             } );
  return bGood ? 0 : 1;
}
