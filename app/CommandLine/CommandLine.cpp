#include "app/CommandLine/CommandLine.h"

#include <boost/program_options.hpp>

#include <vector>

namespace po = boost::program_options;

namespace LumekVideoViewer
{
  int ParseCommandLine( int i_ArgumentCount, const char* const* i_pArguments, const std::string& i_rDefaultServer,
                        VCommandLine& o_rCommandLine, std::ostream& io_rErrors )
  {
    // The table is never printed: no option prints it.
    po::options_description Options( 80, 40 );
    const std::string ServerDescription = "Version check server - default is \"" + i_rDefaultServer + "\"";
    Options.add_options()( "developer", "Enable developer mode" )(
        "version-server", po::value< std::string >()->default_value( i_rDefaultServer ),
        ServerDescription.c_str() )( "spoof-version", po::value< std::string >()->default_value( "" ),
                                     "Spoof the version (testing only). e.g. \"0.3.0.55914h\"" )(
        "input-file", po::value< std::string >()->default_value( "" ), "input file" );
    po::positional_options_description Positional;
    Positional.add( "input-file", -1 );

    // "--version-server=" names an empty server, which is a legal choice; the option library
    // would refuse the empty text after the equal sign, but takes it as a separate argument.
    std::vector< std::string > Arguments;
    for( int i = 1; i < i_ArgumentCount; ++i )
    {
      const std::string Argument = i_pArguments[i];
      const bool bEmptyValue = Argument.size() > 3 && Argument.compare( 0, 2, "--" ) == 0 && Argument.back() == '=' &&
                               Argument.find( '=' ) == Argument.size() - 1;
      const std::string Name = bEmptyValue ? Argument.substr( 2, Argument.size() - 3 ) : std::string();
      if( bEmptyValue && Name != "developer" && Options.find_nothrow( Name, false ) != nullptr )
      {
        Arguments.push_back( "--" + Name );
        Arguments.push_back( "" );
      }
      else
        Arguments.push_back( Argument );
    }

    po::variables_map Variables;
    try
    {
      po::store( po::command_line_parser( Arguments ).options( Options ).positional( Positional ).run(), Variables );
      po::notify( Variables );
    }
    catch( const std::exception& rException )
    {
      io_rErrors << "Error parsing command line: " << rException.what() << std::endl;
      io_rErrors << "Use --help for more information." << std::endl;
      return CommandLineErrorExitCode;
    }

    // The map's keys have no dashes, so this is false in every run: developer mode is kept out of
    // reach of the command line although the option is accepted.
    o_rCommandLine.bDeveloper = Variables.count( "--developer" ) != 0;
    o_rCommandLine.VersionServer = Variables["version-server"].as< std::string >();
    o_rCommandLine.SpoofVersion = Variables["spoof-version"].as< std::string >();
    o_rCommandLine.InputFile = Variables["input-file"].as< std::string >();
    return 0;
  }
} // namespace LumekVideoViewer
