// The installed viewer as a desktop sees it: the install tree, the validators Debian ships, the
// file type database, the thumbnailer command and the .deb.

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <QImage>

#include <boost/algorithm/string.hpp>
#include <boost/filesystem.hpp>

#include <fstream>
#include <set>
#include <sstream>

namespace fs = boost::filesystem;
using LumekTest::RunCommand;
using LumekTest::ShellQuote;

namespace
{
  const std::string s_AppId = "com.lumek.LumekVideoViewer";

  bool Have( const std::string& i_rProgram )
  {
    int ExitCode = -1;
    RunCommand( "command -v " + ShellQuote( i_rProgram ) + " >/dev/null 2>&1", &ExitCode );
    return ExitCode == 0;
  }

  // Runs a shell command; its output, with the exit code checked to be 0.
  std::string MustRun( const std::string& i_rCommand )
  {
    int ExitCode = -1;
    const std::string Out = RunCommand( i_rCommand + " 2>&1", &ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << i_rCommand << "\n" << Out;
    return Out;
  }

  // One `cmake --install` of the build into a folder of its own, shared by the tests of a
  // program run; the tests only read it and write beside it.
  class InstalledTree : public ::testing::Test
  {
  protected:
    static void SetUpTestSuite()
    {
      s_Root = fs::temp_directory_path() / fs::unique_path( "lumek-install-%%%%%%%%" );
      fs::create_directories( s_Root );
      MustRun( "cmake --install " + ShellQuote( LUMEK_BUILD_DIR ) + " --prefix " + ShellQuote( Prefix().string() ) );
      for( fs::recursive_directory_iterator It( Prefix() ), End; It != End; ++It )
        if( !fs::is_directory( It->path() ) )
          s_Installed.insert( fs::relative( It->path(), Prefix() ).string() );
    }
    static void TearDownTestSuite()
    {
      boost::system::error_code Error;
      fs::remove_all( s_Root, Error );
    }
    static fs::path Prefix() { return s_Root / "prefix"; }
    static fs::path Share() { return Prefix() / "share"; }
    static fs::path Scratch( const std::string& i_rName ) { return s_Root / i_rName; }

    // A small .lvid recording written by the installed tool.
    static std::string WriteRecording( const std::string& i_rName )
    {
      const std::string Path = Scratch( i_rName ).string();
      MustRun( ShellQuote( ( Prefix() / "bin/lumekvideotool" ).string() ) + " make-sample " + ShellQuote( Path ) +
               " --width 64 --height 48 --frames 2 --no-audio" );
      return Path;
    }

    static fs::path s_Root;
    // What the install wrote, before the file type database is built inside it.
    static std::set< std::string > s_Installed;
  };
  fs::path InstalledTree::s_Root;
  std::set< std::string > InstalledTree::s_Installed;
} // namespace

TEST_F( InstalledTree, HoldsExactlyTheProgramsAndTheDesktopFiles )
{
  std::set< std::string > Expected = {
      "bin/lumekvideoviewer",
      "bin/lumekvideotool",
      "share/applications/" + s_AppId + ".desktop",
      "share/metainfo/" + s_AppId + ".metainfo.xml",
      "share/mime/packages/" + s_AppId + ".xml",
      "share/thumbnailers/lumekvideotool.thumbnailer",
      "share/icons/hicolor/scalable/apps/" + s_AppId + ".svg",
      "share/man/man1/lumekvideoviewer.1.gz",
      "share/man/man1/lumekvideotool.1.gz",
  };
  for( int Size : { 16, 22, 24, 32, 48, 64, 128, 256 } )
  {
    const std::string Icon =
        "share/icons/hicolor/" + std::to_string( Size ) + "x" + std::to_string( Size ) + "/apps/" + s_AppId + ".png";
    Expected.insert( Icon );
    const QImage Image( QString::fromStdString( ( Prefix() / Icon ).string() ) );
    EXPECT_EQ( Image.size(), QSize( Size, Size ) ) << Icon;
    // A rendered icon, not an empty canvas: its middle is opaque.
    EXPECT_EQ( qAlpha( Image.pixel( Size / 2, Size / 2 ) ), 255 ) << Icon;
  }
  EXPECT_EQ( s_Installed, Expected );
  for( const char* pProgram : { "lumekvideoviewer", "lumekvideotool" } )
    EXPECT_TRUE( fs::status( Prefix() / "bin" / pProgram ).permissions() & fs::owner_exe ) << pProgram;
}

TEST_F( InstalledTree, ManPagesRenderAndCarryTheUsage )
{
  if( !Have( "man" ) )
    GTEST_SKIP() << "man is not installed";
  const auto Render = []( const char* i_pPage )
  { return MustRun( "MANWIDTH=100 man --warnings -l " + ShellQuote( ( Share() / "man/man1" / i_pPage ).string() ) ); };
  const std::string Tool = Render( "lumekvideotool.1.gz" );
  const std::string Viewer = Render( "lumekvideoviewer.1.gz" );
  // Every command of the usage text, option dashes and all, survives roff.
  for( const char* pText : { "thumbnail INPUT OUTPUT.png [--size N]", "info FILE [--frame N] [--compact | --pretty]",
                             "make-sample OUTPUT.lvid", "Exit codes:" } )
    EXPECT_NE( Tool.find( pText ), std::string::npos ) << pText << "\n" << Tool;
  EXPECT_NE( Viewer.find( "--version-server URL" ), std::string::npos ) << Viewer;
  for( const std::string* pPage : { &Tool, &Viewer } )
    EXPECT_EQ( pPage->find( "warning" ), std::string::npos ) << *pPage;
}

TEST_F( InstalledTree, DebianValidatorsAcceptTheDesktopFiles )
{
  const struct
  {
    const char* Program;
    std::string Command; // run with the installed tree's share folder as $SHARE
  } Validators[] = {
      { "desktop-file-validate", "desktop-file-validate \"$SHARE/applications/" + s_AppId + ".desktop\"" },
      { "appstreamcli", "appstreamcli validate --no-net --pedantic \"$SHARE/metainfo/" + s_AppId + ".metainfo.xml\"" },
      { "xmllint", "xmllint --noout --relaxng " + ShellQuote( LUMEK_MIME_SCHEMA ) + " \"$SHARE/mime/packages/" +
                       s_AppId + ".xml\"" },
      { "update-mime-database", "XDG_DATA_DIRS=\"$SHARE\" update-mime-database \"$SHARE/mime\"" },
  };
  std::string Missing;
  for( const auto& rValidator : Validators )
  {
    SCOPED_TRACE( rValidator.Program );
    if( !Have( rValidator.Program ) )
    {
      Missing += std::string( " " ) + rValidator.Program;
      continue;
    }
    const std::string Out = MustRun( "SHARE=" + ShellQuote( Share().string() ) + "; " + rValidator.Command );
    // Some validators answer warnings and hints with exit code 0; they are faults here too.
    const std::string Lower = boost::to_lower_copy( Out );
    for( const char* pWord : { "error", "warning", "unknown", "invalid" } )
      EXPECT_EQ( Lower.find( pWord ), std::string::npos ) << Out;
  }
  if( !Missing.empty() )
    GTEST_SKIP() << "not installed (scripts/install-deps.sh installs them):" << Missing;
}

TEST_F( InstalledTree, FileTypesAreNamedByTheDatabase )
{
  // xdg-mime asks GLib under GNOME; its generic path falls back to file(1), which knows no new types.
  if( !Have( "update-mime-database" ) || !Have( "xdg-mime" ) || !Have( "gio" ) )
    GTEST_SKIP() << "update-mime-database, xdg-mime and gio are needed (scripts/install-deps.sh installs them)";
  MustRun( "update-mime-database " + ShellQuote( ( Share() / "mime" ).string() ) );
  fs::create_directories( Scratch( "home" ) );
  const std::string Recording = WriteRecording( "take.lvid" ), Renamed = Scratch( "take.bin" ).string(),
                    Sequence = Scratch( "take.lumekimagesequence" ).string();
  fs::copy_file( Recording, Renamed );
  std::ofstream( Sequence ) << "frames/take_%06d.png\n";
  // The contents name a recording whatever it is called.
  for( const auto& [Path, Expected] :
       { std::pair( Recording, "video/x-lumek-lvid" ), std::pair( Renamed, "video/x-lumek-lvid" ),
         std::pair( Sequence, "application/x-lumek-imagesequence" ) } )
  {
    const std::string Type = MustRun(
        "XDG_CURRENT_DESKTOP=GNOME XDG_DATA_HOME=" + ShellQuote( Scratch( "home" ).string() ) +
        " XDG_DATA_DIRS=" + ShellQuote( Share().string() ) + " xdg-mime query filetype " + ShellQuote( Path ) );
    EXPECT_EQ( boost::trim_copy( Type ), Expected ) << Path;
  }
}

TEST_F( InstalledTree, ThumbnailerCommandRunsAsWritten )
{
  std::stringstream File;
  File << std::ifstream( ( Share() / "thumbnailers/lumekvideotool.thumbnailer" ).string() ).rdbuf();
  const std::string Text = File.str();
  const auto Exec = Text.find( "\nExec=" ) + 6;
  std::string Command = Text.substr( Exec, Text.find( '\n', Exec ) - Exec );
  EXPECT_EQ( Command, "lumekvideotool thumbnail %i %o --size %s" );
  EXPECT_NE( Text.find( "\nMimeType=video/x-lumek-lvid;" ), std::string::npos ) << Text;

  // As a thumbnail manager runs it: the program from PATH, the fields replaced by quoted words.
  const std::string Output = Scratch( "thumb nail.png" ).string();
  boost::replace_all( Command, "%i", ShellQuote( WriteRecording( "a take with spaces.lvid" ) ) );
  boost::replace_all( Command, "%o", ShellQuote( Output ) );
  boost::replace_all( Command, "%s", "32" );
  MustRun( "PATH=" + ShellQuote( ( Prefix() / "bin" ).string() ) + ":/usr/bin:/bin " + Command );
  EXPECT_EQ( QImage( QString::fromStdString( Output ) ).size(), QSize( 32, 24 ) );
}

// The package holds what the install tree holds, under /usr, and nothing to build against.
TEST_F( InstalledTree, DebianPackageControlAndContents )
{
  if( !Have( "dpkg-deb" ) || !Have( "cpack" ) )
    GTEST_SKIP() << "dpkg-deb and cpack are needed";
  const std::string Folder = ShellQuote( Scratch( "deb" ).string() );
  MustRun( "mkdir " + Folder + " && cd " + Folder + " && cpack -G DEB --config " +
           ShellQuote( std::string( LUMEK_BUILD_DIR ) + "/CPackConfig.cmake" ) );
  const std::string Deb = boost::trim_copy( MustRun( "ls " + Folder + "/*.deb" ) );
  const auto Field = [&]( const std::string& i_rName )
  { return boost::trim_copy( RunCommand( "dpkg-deb -f " + ShellQuote( Deb ) + " " + i_rName ) ); };
  EXPECT_EQ( Field( "Package" ), "lumekvideoviewer" );
  EXPECT_EQ( Field( "Section" ), "video" );
  const std::string Depends = Field( "Depends" );
  for( const char* pPackage : { "libqt5widgets5", "libqt5multimedia5", "libopenh264-7", "libturbojpeg0", "libebml5",
                                "libmatroska7", "libboost-program-options1.74.0" } )
    EXPECT_NE( Depends.find( pPackage ), std::string::npos ) << pPackage << " in " << Depends;
  // The viewer runs without MagickWand: only recommended.
  EXPECT_EQ( Depends.find( "magick" ), std::string::npos ) << Depends;
  EXPECT_EQ( Field( "Recommends" ), "libmagickwand-6.q16-6" );
  // Every dependency is a real Debian package: this machine has each installed for the build.
  std::vector< std::string > Packages;
  boost::split( Packages, Depends, boost::is_any_of( "," ) );
  for( std::string& rPackage : Packages )
    MustRun( "dpkg-query -W " + ShellQuote( boost::trim_copy( rPackage ) ) + " >/dev/null" );

  const std::string Contents = RunCommand( "dpkg-deb -c " + ShellQuote( Deb ) );
  for( const std::string& rPath : s_Installed )
    EXPECT_NE( Contents.find( "./usr/" + rPath + "\n" ), std::string::npos ) << rPath << "\n" << Contents;
  for( const char* pFolder : { "./usr/lib", "./usr/include" } )
    EXPECT_EQ( Contents.find( pFolder ), std::string::npos ) << Contents;
}
