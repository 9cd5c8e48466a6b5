#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <cstdio>
#include <filesystem>
#include <functional>
#include <sstream>
#include <sys/wait.h>
#include <unistd.h>

namespace fs = std::filesystem;

namespace LumekTest
{
  namespace
  {
    fs::path FixtureFolder()
    {
      if( const char* pFolder = std::getenv( "LUMEK_FIXTURE_DIR" ) )
        return pFolder;
      return LUMEK_FIXTURE_DIR;
    }

    std::string JoinQuoted( const std::vector< std::string >& i_rWords )
    {
      std::string Line;
      for( const std::string& rWord : i_rWords )
        Line += " " + ShellQuote( rWord );
      return Line;
    }
  } // namespace

  std::string ShellQuote( const std::string& i_rWord )
  {
    std::string Quoted = "'";
    for( char Character : i_rWord )
      Quoted += Character == '\'' ? std::string( "'\\''" ) : std::string( 1, Character );
    return Quoted + "'";
  }

  std::string RunCommand( const std::string& i_rCommandLine, int* o_pExitCode )
  {
    std::string Output;
    FILE* pPipe = ::popen( i_rCommandLine.c_str(), "r" );
    if( !pPipe )
    {
      if( o_pExitCode )
        *o_pExitCode = -1;
      return Output;
    }
    char Block[65536];
    std::size_t Count;
    while( ( Count = std::fread( Block, 1, sizeof( Block ), pPipe ) ) > 0 )
      Output.append( Block, Count );
    const int Status = ::pclose( pPipe );
    if( o_pExitCode )
      *o_pExitCode = WIFEXITED( Status ) ? WEXITSTATUS( Status ) : -1;
    return Output;
  }

  bool HaveFfmpeg()
  {
    static const bool s_bHave = []
    {
      int ExitCode = 0;
      RunCommand( "ffmpeg -version >/dev/null 2>&1 && ffprobe -version >/dev/null 2>&1", &ExitCode );
      return ExitCode == 0;
    }();
    return s_bHave;
  }

  std::string FfmpegFixture( const std::string& i_rName, const std::vector< std::string >& i_rArguments )
  {
    const std::string Arguments = JoinQuoted( i_rArguments );
    // The arguments are part of the name, so that changing a fixture's recipe makes a new file.
    std::ostringstream Hash;
    Hash << std::hex << std::hash< std::string >{}( Arguments );
    const fs::path Name( i_rName );
    const fs::path Folder = FixtureFolder();
    const fs::path Path = Folder / ( Name.stem().string() + "-" + Hash.str() + Name.extension().string() );
    std::error_code Error;
    if( fs::exists( Path, Error ) )
      return Path.string();
    fs::create_directories( Folder, Error );
    // Made under a name of this process and renamed into place, so that a test never sees half a
    // file while another process is still writing it.
    const fs::path Partial = Folder / ( "partial-" + std::to_string( ::getpid() ) + "-" + Path.filename().string() );
    const std::string Command =
        "ffmpeg -nostdin -y -v error" + Arguments + " " + ShellQuote( Partial.string() ) + " 2>&1";
    int ExitCode = 0;
    const std::string Words = RunCommand( Command, &ExitCode );
    if( ExitCode != 0 || !fs::exists( Partial, Error ) )
    {
      fs::remove( Partial, Error );
      ADD_FAILURE() << "ffmpeg could not make " << i_rName << ":\n" << Command << "\n" << Words;
      return {};
    }
    fs::rename( Partial, Path, Error );
    if( Error )
    {
      ADD_FAILURE() << "Cannot move " << Partial << " to " << Path << ": " << Error.message();
      return {};
    }
    return Path.string();
  }

  std::vector< std::uint8_t > FfmpegDecode( const std::string& i_rPath, const std::string& i_rPixelFormat,
                                            const std::vector< std::string >& i_rExtraInputArguments )
  {
    const std::string Command = "ffmpeg -nostdin -v error -threads 1" + JoinQuoted( i_rExtraInputArguments ) + " -i " +
                                ShellQuote( i_rPath ) + " -map 0:v:0 -f rawvideo -pix_fmt " +
                                ShellQuote( i_rPixelFormat ) + " -";
    int ExitCode = 0;
    const std::string Output = RunCommand( Command, &ExitCode );
    if( ExitCode != 0 )
    {
      ADD_FAILURE() << "ffmpeg could not decode " << i_rPath << ": " << Command;
      return {};
    }
    return std::vector< std::uint8_t >( Output.begin(), Output.end() );
  }

  std::string Ffprobe( const std::string& i_rPath, const std::vector< std::string >& i_rArguments )
  {
    return RunCommand( "ffprobe -v error" + JoinQuoted( i_rArguments ) + " " + ShellQuote( i_rPath ) );
  }

  void ExpectSameToolFrames( const std::string& i_rTool, const std::string& i_rFirst, const std::string& i_rSecond,
                             int i_Count )
  {
    const fs::path Folder = fs::temp_directory_path() / ( "toolframes-" + std::to_string( ::getpid() ) );
    const fs::path Folders[] = { Folder / "first", Folder / "second" };
    const std::string* Inputs[] = { &i_rFirst, &i_rSecond };
    for( int i = 0; i < 2; ++i )
    {
      fs::create_directories( Folders[i] );
      int ExitCode = -1;
      const std::string Out = RunCommand( i_rTool + " frames " + ShellQuote( *Inputs[i] ) + " " +
                                              ShellQuote( Folders[i].string() ) + " 2>&1",
                                          &ExitCode );
      ASSERT_EQ( ExitCode, 0 ) << Out;
    }
    int Compared = 0;
    for( fs::directory_iterator It( Folders[0] ), End; It != End; ++It, ++Compared )
    {
      const std::string Name = It->path().filename().string();
      const std::string Same = RunCommand( "cmp -s " + ShellQuote( It->path().string() ) + " " +
                                           ShellQuote( ( Folders[1] / Name ).string() ) + " && echo same" );
      EXPECT_EQ( Same, "same\n" ) << Name;
    }
    EXPECT_EQ( Compared, i_Count );
    std::error_code Error;
    fs::remove_all( Folder, Error );
  }
} // namespace LumekTest
