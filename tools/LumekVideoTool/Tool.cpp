#include "services/Log.h"
#include "tools/LumekVideoTool/ToolCommon.h"

#include <iostream>
#include <map>
#include <mutex>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  const char* UsageText()
  {
    return "Usage: lumekvideotool COMMAND ...\n"
           "\n"
           "Commands:\n"
           "  info FILE [--frame N]         what the viewer shows about the file and frame N, as JSON\n"
           "  frames FILE OUTDIR [--first N] [--count N] [--png]\n"
           "                                writes frames as OUTDIR/frame_NNNNNN.ppm (or .png), converted\n"
           "                                to RGB with the file's display settings\n"
           "  dump FILE                     the container's structure, where the reader has one\n"
           "  convert INPUT OUTPUT.lvid     every frame of INPUT into a .lvid recording\n"
           "  bench FILE [--frames N] [--software]\n"
           "                                reads and decodes frames as playback does; speed as JSON\n"
           "  make-sample OUTPUT.lvid [--width W] [--height H] [--frames N] [--fps F] [--format NAME]\n"
           "                          [--audio | --no-audio]\n"
           "                                writes a synthetic recording (default BayerGB8 1280x720,\n"
           "                                300 frames at 100 fps, with a stereo test tone)\n"
           "\n"
           "Exit codes: 0 success, 1 the file cannot be opened, 2 usage error, 3 some frames could not\n"
           "be read or decoded (the others are written).\n";
  }

  bool OpenSource( LumekVideoViewer::VVideoSource& io_rSource, const std::string& i_rPath, std::ostream& o_rErr )
  {
    std::vector< std::string > Reasons;
    std::mutex ReasonsMutex;
    const int Sink = ZOL::GlobalLog().AddSink(
        [&]( const ZOL::ILogRecord& i_rRecord )
        {
          std::lock_guard< std::mutex > Lock( ReasonsMutex );
          Reasons.push_back( i_rRecord.Message );
        },
        ZOL::LogFailure );
    const bool bOpen = io_rSource.Open( i_rPath );
    ZOL::GlobalLog().RemoveSink( Sink );
    if( bOpen )
      return true;
    o_rErr << "The video file could not be opened." << std::endl;
    for( const std::string& rReason : Reasons )
      o_rErr << rReason << std::endl;
    return false;
  }

  std::optional< po::variables_map > ParseArguments( const VArguments& i_rArguments,
                                                     const po::options_description& i_rOptions,
                                                     const po::positional_options_description& i_rPositional,
                                                     const char* i_pCommand, std::ostream& o_rErr )
  {
    po::variables_map Variables;
    try
    {
      po::store( po::command_line_parser( i_rArguments ).options( i_rOptions ).positional( i_rPositional ).run(),
                 Variables );
      po::notify( Variables );
    }
    catch( const std::exception& rException )
    {
      o_rErr << "lumekvideotool " << i_pCommand << ": " << rException.what() << "\n\n" << UsageText();
      return std::nullopt;
    }
    return Variables;
  }

  int RunTool( const VArguments& i_rArguments, std::ostream& o_rOut, std::ostream& o_rErr )
  {
    using Command = int ( * )( const VArguments&, std::ostream&, std::ostream& );
    static const std::map< std::string, Command > s_Commands = {
        { "info", &RunInfo },       { "frames", &RunFrames }, { "dump", &RunDump },
        { "convert", &RunConvert }, { "bench", &RunBench },   { "make-sample", &RunMakeSample } };

    if( i_rArguments.empty() )
    {
      o_rErr << UsageText();
      return Exit_Usage;
    }
    if( i_rArguments[0] == "--help" || i_rArguments[0] == "-h" || i_rArguments[0] == "help" )
    {
      o_rOut << UsageText();
      return Exit_Success;
    }
    const auto Found = s_Commands.find( i_rArguments[0] );
    if( Found == s_Commands.end() )
    {
      o_rErr << "lumekvideotool: unknown command '" << i_rArguments[0] << "'\n\n" << UsageText();
      return Exit_Usage;
    }
    const VArguments Rest( i_rArguments.begin() + 1, i_rArguments.end() );
    for( const std::string& rArgument : Rest )
      if( rArgument == "--help" || rArgument == "-h" )
      {
        o_rOut << UsageText();
        return Exit_Success;
      }
    return Found->second( Rest, o_rOut, o_rErr );
  }
} // namespace LumekVideoTool
