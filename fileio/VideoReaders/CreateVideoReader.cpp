#include "fileio/VideoReaders/CreateVideoReader.h"

#include "fileio/ImageSequenceIO/VImageSequenceReader.h"
#include "fileio/LumekVideo/VReader.h"
#include "fileio/MkvIO/VMkvReader.h"
#include "fileio/MovIO/VMovReader.h"
#include "fileio/RapidAVI/VRapidAVIReader.h"

#include <iterator>

namespace
{
  using VReaderFactory = std::shared_ptr< ZOL::IVideoReader > ( * )();

  template < typename TReader > std::shared_ptr< ZOL::IVideoReader > MakeReader()
  {
    return std::make_shared< TReader >();
  }

  struct VReaderRow
  {
    ZOL::EVideoContainer Container;
    VReaderFactory Create;
  };

  // One row per container that has a reader; a container without a row gives no reader.
  constexpr VReaderRow s_Readers[] = {
      { ZOL::VideoContainer_AVI, &MakeReader< RapidAVI::VRapidAVIReader > },
      { ZOL::VideoContainer_IMAGES, &MakeReader< ImageSequenceIO::VImageSequenceReader > },
      { ZOL::VideoContainer_LVID, &MakeReader< LumekVideo::VReader > },
      { ZOL::VideoContainer_MKV, &MakeReader< MkvIO::VMkvReader > },
      { ZOL::VideoContainer_MOV, &MakeReader< MovIO::VMovReader > },
      { ZOL::VideoContainer_MP4, &MakeReader< MovIO::VMovReader > },
  };
} // namespace

std::shared_ptr< ZOL::IVideoReader > CreateVideoReader( const std::string& i_FileName )
{
  const std::optional< ZOL::EVideoContainer > Container = ZOL::FindVideoContainer( i_FileName );
  if( !Container )
    return nullptr;
  for( const VReaderRow& rRow : s_Readers )
    if( rRow.Container == *Container )
      return rRow.Create();
  return nullptr;
}
