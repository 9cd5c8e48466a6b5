// The installed viewer as a desktop sees it: the install tree, the validators Debian ships, the
// file type database, the thumbnailer command and the .deb.

#include "tests/support/FfmpegFixtures.h"

#include <gtest/gtest.h>

#include <QImage>

#include <boost/algorithm/string.hpp>
#include <boost/filesystem.hpp>

#include <fstream>
#include <set>

namespace fs = boost::filesystem;
using LumekTest::RunCommand;
using LumekTest::ShellQuote;

namespace
{
  const std::string s_AppId = "com.lumek.LumekVideoViewer";

  // The programs of the list that this machine lacks, each after a space.
  std::string Missing( std::initializer_list< std::string > i_Programs )
  {
    std::string Absent;
    for( const std::string& rProgram : i_Programs )
      if( RunCommand( "command -v " + ShellQuote( rProgram ) ).empty() )
        Absent += " " + rProgram;
    return Absent;
  }
  const char* const s_Install = "not installed (scripts/install-deps.sh installs them):";

  // Runs a shell command; its output, with the exit code checked to be 0.
  std::string MustRun( const std::string& i_rCommand )
  {
    int ExitCode = -1;
    const std::string Out = RunCommand( i_rCommand + " 2>&1", &ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << i_rCommand << "\n" << Out;
    return Out;
  }

  // One `cmake --install` of the build into a folder of its own, shared by the tests of a
  // program run, with a small recording written by the installed tool beside it; the tests only
  // read the tree and write beside it.
  class InstalledTree : public ::testing::Test
  {
  protected:
    static void SetUpTestSuite()
    {
      s_Root = boost::trim_copy( MustRun( "mktemp -d" ) );
      MustRun( "cmake --install " + ShellQuote( LUMEK_BUILD_DIR ) + " --prefix " + ShellQuote( Prefix().string() ) );
      for( fs::recursive_directory_iterator It( Prefix() ), End; It != End; ++It )
        if( !fs::is_directory( It->path() ) )
          s_Installed.insert( fs::relative( It->path(), Prefix() ).string() );
      MustRun( ShellQuote( ( Prefix() / "bin/lumekvideotool" ).string() ) + " make-sample " +
               ShellQuote( Recording() ) + " --width 64 --height 48 --frames 2 --no-audio" );
    }
    static void TearDownTestSuite() { RunCommand( "rm -rf " + ShellQuote( s_Root.string() ) ); }
    static fs::path Prefix() { return s_Root / "prefix"; }
    static fs::path Share() { return Prefix() / "share"; }
    static fs::path Scratch( const std::string& i_rName ) { return s_Root / i_rName; }
    static std::string Recording() { return Scratch( "a take with spaces.lvid" ).string(); }

    inline static fs::path s_Root;
    // What the install wrote, before the file type database is built inside it.
    inline static std::set< std::string > s_Installed;
  };
} // namespace

TEST_F( InstalledTree, HoldsExactlyTheProgramsTheirPagesAndTheDesktopFiles )
{
  std::set< std::string > Expected = { "bin/lumekvideoviewer",
                                       "bin/lumekvideotool",
                                       "share/applications/" + s_AppId + ".desktop",
                                       "share/metainfo/" + s_AppId + ".metainfo.xml",
                                       "share/mime/packages/" + s_AppId + ".xml",
                                       "share/thumbnailers/lumekvideotool.thumbnailer",
                                       "share/icons/hicolor/scalable/apps/" + s_AppId + ".svg",
                                       "share/man/man1/lumekvideoviewer.1.gz",
                                       "share/man/man1/lumekvideotool.1.gz" };
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

  // The manual pages render without warnings.
  if( const std::string Absent = Missing( { "man" } ); !Absent.empty() )
    GTEST_SKIP() << s_Install << Absent;
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

// The thumbnailer's command runs as written, the validators Debian ships accept the desktop files,
// and the file type database built from them names each type.
TEST_F( InstalledTree, DesktopFilesAreValidAndWorkAsWritten )
{
  const std::string Text =
      MustRun( "cat " + ShellQuote( ( Share() / "thumbnailers/lumekvideotool.thumbnailer" ).string() ) );
  const auto Exec = Text.find( "\nExec=" ) + 6;
  std::string Command = Text.substr( Exec, Text.find( '\n', Exec ) - Exec );
  EXPECT_EQ( Command, "lumekvideotool thumbnail %i %o --size %s" );
  EXPECT_NE( Text.find( "\nMimeType=video/x-lumek-lvid;" ), std::string::npos ) << Text;
  // As a thumbnail manager runs it: the program from PATH, the fields replaced by quoted words.
  const std::string Output = Scratch( "thumb nail.png" ).string();
  boost::replace_all( Command, "%i", ShellQuote( Recording() ) );
  boost::replace_all( Command, "%o", ShellQuote( Output ) );
  boost::replace_all( Command, "%s", "32" );
  MustRun( "PATH=" + ShellQuote( ( Prefix() / "bin" ).string() ) + ":/usr/bin:/bin " + Command );
  EXPECT_EQ( QImage( QString::fromStdString( Output ) ).size(), QSize( 32, 24 ) );

  // xdg-mime asks GLib under GNOME; its generic path falls back to file(1), which knows no new types.
  if( const std::string Absent =
          Missing( { "desktop-file-validate", "appstreamcli", "xmllint", "update-mime-database", "xdg-mime", "gio" } );
      !Absent.empty() )
    GTEST_SKIP() << s_Install << Absent;
  const std::string At = ShellQuote( Share().string() );
  for( const std::string& rCommand :
       { "desktop-file-validate " + At + "/applications/" + s_AppId + ".desktop",
         "appstreamcli validate --no-net --pedantic " + At + "/metainfo/" + s_AppId + ".metainfo.xml",
         "xmllint --noout --relaxng " + ShellQuote( LUMEK_MIME_SCHEMA ) + " " + At + "/mime/packages/" + s_AppId +
             ".xml",
         "XDG_DATA_DIRS=" + At + " update-mime-database " + At + "/mime" } )
  {
    // Some validators answer warnings and hints with exit code 0; they are faults here too.
    const std::string Out = boost::to_lower_copy( MustRun( rCommand ) );
    for( const char* pWord : { "error", "warning", "unknown", "invalid" } )
      EXPECT_EQ( Out.find( pWord ), std::string::npos ) << rCommand << "\n" << Out;
  }

  const std::string Renamed = Scratch( "take.bin" ).string(), Sequence = Scratch( "take.lumekimagesequence" ).string();
  fs::copy_file( Recording(), Renamed );
  std::ofstream( Sequence ) << "frames/take_%06d.png\n";
  // The contents name a recording whatever it is called.
  for( const auto& [Path, Expected] :
       { std::pair( Recording(), "video/x-lumek-lvid" ), std::pair( Renamed, "video/x-lumek-lvid" ),
         std::pair( Sequence, "application/x-lumek-imagesequence" ) } )
  {
    const std::string Type = MustRun( "XDG_CURRENT_DESKTOP=GNOME XDG_DATA_HOME=" + ShellQuote( s_Root.string() ) +
                                      " XDG_DATA_DIRS=" + ShellQuote( Share().string() ) + " xdg-mime query filetype " +
                                      ShellQuote( Path ) );
    EXPECT_EQ( boost::trim_copy( Type ), Expected ) << Path;
  }
}

// The package holds what the install tree holds, under /usr, and nothing to build against.
TEST_F( InstalledTree, DebianPackageControlAndContents )
{
  if( const std::string Absent = Missing( { "dpkg-deb", "cpack" } ); !Absent.empty() )
    GTEST_SKIP() << s_Install << Absent;
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
