#include "app/VideoSource/VideoSourceTexts.h"
#include "services/Log.h"
#include "tools/LumekVideoTool/ToolCommon.h"

#include <iostream>
#include <mutex>
#include <sstream>

namespace po = boost::program_options;

namespace LumekVideoTool
{
  const std::vector< VToolCommand >& ToolCommands()
  {
    static const std::vector< VToolCommand > s_Commands = {
        { "info", "FILE [--frame N] [--compact | --pretty]",
          "what the viewer shows about the file and frame N, as JSON\n"
          "(indented at a terminal, compact otherwise)",
          &RunInfo },
        { "frames", "FILE OUTDIR [--first N] [--count N] [--png]",
          "writes frames as OUTDIR/frame_NNNNNN.ppm (or .png), converted\n"
          "to RGB with the file's display settings",
          &RunFrames },
        { "dump", "FILE", "the container's structure, where the reader has one", &RunDump },
        { "convert", "INPUT OUTPUT.lvid", "every frame of INPUT into a .lvid recording", &RunConvert },
        { "bench", "FILE [--frames N] [--software] [--compact | --pretty]",
          "reads and decodes frames as playback does; speed as JSON", &RunBench },
        { "make-sample",
          "OUTPUT.lvid|.mkv|.lumekimagesequence [--width W] [--height H]\n"
          "[--frames N] [--fps F] [--format NAME] [--audio | --no-audio]\n"
          "[--frame-format png|jpeg]",
          "writes a synthetic recording (default BayerGB8 1280x720,\n"
          "300 frames at 100 fps, with a stereo test tone); the name\n"
          "picks the container: .mkv holds U8Y8V8Y8 by default, and\n"
          ".lumekimagesequence a descriptor with one PNG (or JPEG)\n"
          "picture a frame beside it, without sound",
          &RunMakeSample },
        { "thumbnail", "INPUT OUTPUT.png [--size N]",
          "a PNG preview for file managers: the first frame that reads, as\n"
          "the viewer shows it, scaled to fit N x N (default 256)",
          &RunThumbnail },
    };
    return s_Commands;
  }

  const VToolCommand* FindToolCommand( const std::string& i_rName )
  {
    for( const VToolCommand& rCommand : ToolCommands() )
      if( i_rName == rCommand.Name )
        return &rCommand;
    return nullptr;
  }

  namespace
  {
    // Descriptions start in this column; a synopsis that reaches it puts its description below.
    constexpr std::size_t s_DescriptionColumn = 32;

    std::vector< std::string > SplitLines( const std::string& i_rText )
    {
      std::vector< std::string > Lines;
      std::istringstream Stream( i_rText );
      for( std::string Line; std::getline( Stream, Line ); )
        Lines.push_back( Line );
      return Lines;
    }

    void WriteCommandUsage( std::string& io_rText, const VToolCommand& i_rCommand )
    {
      const std::string Lead = std::string( "  " ) + i_rCommand.Name + " ";
      const std::vector< std::string > Arguments = SplitLines( i_rCommand.Arguments );
      std::string Line = Lead + ( Arguments.empty() ? std::string() : Arguments[0] );
      for( std::size_t i = 1; i < Arguments.size(); ++i )
      {
        io_rText += Line + "\n";
        Line = std::string( Lead.size(), ' ' ) + Arguments[i];
      }
      for( const std::string& rDescription : SplitLines( i_rCommand.Description ) )
      {
        if( Line.size() >= s_DescriptionColumn )
        {
          io_rText += Line + "\n";
          Line.clear();
        }
        Line.resize( s_DescriptionColumn, ' ' );
        io_rText += Line + rDescription + "\n";
        Line.clear();
      }
      if( !Line.empty() )
        io_rText += Line + "\n";
    }
  } // namespace

  const std::string& UsageText()
  {
    static const std::string s_Text = []
    {
      std::string Text = "Usage: lumekvideotool COMMAND ...\n"
                         "\n"
                         "Commands:\n";
      for( const VToolCommand& rCommand : ToolCommands() )
        WriteCommandUsage( Text, rCommand );
      Text += "\n"
              "Exit codes: 0 success, 1 the file cannot be opened, 2 usage error, 3 some frames could not\n"
              "be read or decoded (the others are written).\n";
      return Text;
    }();
    return s_Text;
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
    o_rErr << LumekVideoViewer::ComposeOpenFailureText( i_rPath ) << std::endl;
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
    const VToolCommand* pCommand = FindToolCommand( i_rArguments[0] );
    if( !pCommand )
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
    return pCommand->Run( Rest, o_rOut, o_rErr );
  }
} // namespace LumekVideoTool
