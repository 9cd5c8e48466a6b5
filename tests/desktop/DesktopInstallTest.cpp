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
  const int s_IconSizes[] = { 16, 22, 24, 32, 48, 64, 128, 256 };

  bool Have( const std::string& i_rProgram )
  {
    int ExitCode = -1;
    RunCommand( "command -v " + ShellQuote( i_rProgram ) + " >/dev/null 2>&1", &ExitCode );
    return ExitCode == 0;
  }

  std::string ReadText( const fs::path& i_rPath )
  {
    std::ifstream File( i_rPath.string() );
    std::stringstream Text;
    Text << File.rdbuf();
    return Text.str();
  }

  // A fresh `cmake --install` of the build into a folder of its own.
  class InstalledTree : public ::testing::Test
  {
  protected:
    void SetUp() override
    {
      m_Root = fs::temp_directory_path() / fs::unique_path( "lumek-install-%%%%%%%%" );
      fs::create_directories( m_Root );
      int ExitCode = -1;
      const std::string Out = RunCommand( "cmake --install " + ShellQuote( LUMEK_BUILD_DIR ) + " --prefix " +
                                              ShellQuote( Prefix().string() ) + " 2>&1",
                                          &ExitCode );
      ASSERT_EQ( ExitCode, 0 ) << Out;
    }
    void TearDown() override
    {
      boost::system::error_code Error;
      fs::remove_all( m_Root, Error );
    }
    fs::path Prefix() const { return m_Root / "prefix"; }
    fs::path Share() const { return Prefix() / "share"; }
    fs::path Scratch( const std::string& i_rName ) const { return m_Root / i_rName; }

    std::set< std::string > InstalledFiles() const
    {
      std::set< std::string > Files;
      for( fs::recursive_directory_iterator It( Prefix() ), End; It != End; ++It )
        if( !fs::is_directory( It->path() ) )
          Files.insert( fs::relative( It->path(), Prefix() ).string() );
      return Files;
    }

    // A small .lvid recording written by the installed tool.
    std::string WriteRecording( const std::string& i_rName ) const
    {
      const std::string Path = Scratch( i_rName ).string();
      int ExitCode = -1;
      const std::string Out = RunCommand( ShellQuote( ( Prefix() / "bin/lumekvideotool" ).string() ) + " make-sample " +
                                              ShellQuote( Path ) + " --width 64 --height 48 --frames 2 --no-audio 2>&1",
                                          &ExitCode );
      EXPECT_EQ( ExitCode, 0 ) << Out;
      return Path;
    }

  private:
    fs::path m_Root;
  };
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
  for( int Size : s_IconSizes )
    Expected.insert( "share/icons/hicolor/" + std::to_string( Size ) + "x" + std::to_string( Size ) + "/apps/" +
                     s_AppId + ".png" );
  EXPECT_EQ( InstalledFiles(), Expected );

  for( int Size : s_IconSizes )
  {
    const fs::path Icon = Share() / "icons/hicolor" / ( std::to_string( Size ) + "x" + std::to_string( Size ) ) /
                          "apps" / ( s_AppId + ".png" );
    const QImage Image( QString::fromStdString( Icon.string() ) );
    EXPECT_EQ( Image.size(), QSize( Size, Size ) ) << Icon;
    // A rendered icon, not an empty canvas: its middle is opaque.
    EXPECT_EQ( qAlpha( Image.pixel( Size / 2, Size / 2 ) ), 255 ) << Icon;
  }
  for( const char* pProgram : { "lumekvideoviewer", "lumekvideotool" } )
    EXPECT_TRUE( fs::status( Prefix() / "bin" / pProgram ).permissions() & fs::owner_exe ) << pProgram;
}

TEST_F( InstalledTree, ManPagesRenderAndCarryTheUsage )
{
  if( !Have( "man" ) )
    GTEST_SKIP() << "man is not installed";
  const fs::path Pages = Share() / "man/man1";
  int ExitCode = -1;
  const std::string Tool = RunCommand( "MANWIDTH=100 man --warnings -l " +
                                           ShellQuote( ( Pages / "lumekvideotool.1.gz" ).string() ) + " 2>&1",
                                       &ExitCode );
  EXPECT_EQ( ExitCode, 0 ) << Tool;
  // Every command of the usage text, option dashes and all, survives roff.
  for( const char* pText : { "thumbnail INPUT OUTPUT.png [--size N]", "info FILE [--frame N] [--compact | --pretty]",
                             "make-sample OUTPUT.lvid", "Exit codes:" } )
    EXPECT_NE( Tool.find( pText ), std::string::npos ) << pText << "\n" << Tool;
  EXPECT_EQ( Tool.find( "warning" ), std::string::npos ) << Tool;

  const std::string Viewer = RunCommand( "MANWIDTH=100 man --warnings -l " +
                                             ShellQuote( ( Pages / "lumekvideoviewer.1.gz" ).string() ) + " 2>&1",
                                         &ExitCode );
  EXPECT_EQ( ExitCode, 0 ) << Viewer;
  EXPECT_NE( Viewer.find( "--version-server URL" ), std::string::npos ) << Viewer;
  EXPECT_EQ( Viewer.find( "warning" ), std::string::npos ) << Viewer;
}

struct VValidator
{
  const char* Name;
  const char* Program;
  std::string Command; // run with the installed tree's share folder as $SHARE
};

// Test names and failure messages show the case's name, not its bytes.
void PrintTo( const VValidator& i_rValidator, std::ostream* o_pOut )
{
  *o_pOut << i_rValidator.Name;
}

class InstalledFileValidator : public InstalledTree, public ::testing::WithParamInterface< VValidator >
{
};

TEST_P( InstalledFileValidator, Accepts )
{
  const VValidator& rValidator = GetParam();
  if( !Have( rValidator.Program ) )
    GTEST_SKIP() << rValidator.Program << " is not installed (scripts/install-deps.sh installs it)";
  int ExitCode = -1;
  const std::string Out =
      RunCommand( "SHARE=" + ShellQuote( Share().string() ) + "; " + rValidator.Command + " 2>&1", &ExitCode );
  EXPECT_EQ( ExitCode, 0 ) << Out;
  // Some validators answer warnings and hints with exit code 0; they are faults here too.
  const std::string Lower = boost::to_lower_copy( Out );
  for( const char* pWord : { "error", "warning", "unknown", "invalid" } )
    EXPECT_EQ( Lower.find( pWord ), std::string::npos ) << Out;
}

INSTANTIATE_TEST_SUITE_P(
    Debian, InstalledFileValidator,
    ::testing::Values( VValidator{ "DesktopEntry", "desktop-file-validate",
                                   "desktop-file-validate \"$SHARE/applications/" + s_AppId + ".desktop\"" },
                       VValidator{ "AppStream", "appstreamcli",
                                   "appstreamcli validate --no-net --pedantic \"$SHARE/metainfo/" + s_AppId +
                                       ".metainfo.xml\"" },
                       VValidator{ "MimePackage", "xmllint",
                                   "xmllint --noout --relaxng " + ShellQuote( LUMEK_MIME_SCHEMA ) +
                                       " \"$SHARE/mime/packages/" + s_AppId + ".xml\"" },
                       VValidator{ "MimeDatabase", "update-mime-database",
                                   "XDG_DATA_DIRS=\"$SHARE\" update-mime-database \"$SHARE/mime\"" } ),
    []( const ::testing::TestParamInfo< VValidator >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

struct VFileTypeCase
{
  const char* Name;
  const char* FileName;
  bool bRecording; // a real recording, or a few bytes of text
  const char* Expected;
};

void PrintTo( const VFileTypeCase& i_rCase, std::ostream* o_pOut )
{
  *o_pOut << i_rCase.Name;
}

class InstalledFileType : public InstalledTree, public ::testing::WithParamInterface< VFileTypeCase >
{
};

TEST_P( InstalledFileType, IsNamedByTheDatabase )
{
  const VFileTypeCase& rCase = GetParam();
  // xdg-mime asks GLib under GNOME; its generic path falls back to file(1), which knows no new types.
  if( !Have( "update-mime-database" ) || !Have( "xdg-mime" ) || !Have( "gio" ) )
    GTEST_SKIP() << "update-mime-database, xdg-mime and gio are needed (scripts/install-deps.sh installs them)";
  int ExitCode = -1;
  const std::string Update =
      RunCommand( "update-mime-database " + ShellQuote( ( Share() / "mime" ).string() ) + " 2>&1", &ExitCode );
  ASSERT_EQ( ExitCode, 0 ) << Update;

  std::string Path = Scratch( rCase.FileName ).string();
  if( rCase.bRecording )
    fs::rename( WriteRecording( "made.lvid" ), Path );
  else
    std::ofstream( Path ) << "frames/take_%06d.png\n";
  fs::create_directories( Scratch( "home" ) );
  const std::string Type =
      RunCommand( "XDG_CURRENT_DESKTOP=GNOME XDG_DATA_HOME=" + ShellQuote( Scratch( "home" ).string() ) +
                      " XDG_DATA_DIRS=" + ShellQuote( Share().string() ) + " xdg-mime query filetype " +
                      ShellQuote( Path ) + " 2>/dev/null",
                  &ExitCode );
  EXPECT_EQ( ExitCode, 0 );
  EXPECT_EQ( boost::trim_copy( Type ), rCase.Expected );
}

INSTANTIATE_TEST_SUITE_P(
    Files, InstalledFileType,
    ::testing::Values( VFileTypeCase{ "Recording", "take.lvid", true, "video/x-lumek-lvid" },
                       VFileTypeCase{ "RecordingWithoutExtension", "take", true, "video/x-lumek-lvid" },
                       VFileTypeCase{ "RecordingWithAnotherExtension", "take.bin", true, "video/x-lumek-lvid" },
                       VFileTypeCase{ "ImageSequence", "take.lumekimagesequence", false,
                                      "application/x-lumek-imagesequence" } ),
    []( const ::testing::TestParamInfo< VFileTypeCase >& i_rInfo ) { return std::string( i_rInfo.param.Name ); } );

TEST_F( InstalledTree, ThumbnailerCommandRunsAsWritten )
{
  const std::string Entry = ReadText( Share() / "thumbnailers/lumekvideotool.thumbnailer" );
  std::string Exec, MimeTypes;
  std::istringstream Lines( Entry );
  for( std::string Line; std::getline( Lines, Line ); )
  {
    if( boost::starts_with( Line, "Exec=" ) )
      Exec = Line.substr( 5 );
    if( boost::starts_with( Line, "MimeType=" ) )
      MimeTypes = Line.substr( 9 );
  }
  EXPECT_EQ( Exec, "lumekvideotool thumbnail %i %o --size %s" );
  EXPECT_NE( MimeTypes.find( "video/x-lumek-lvid;" ), std::string::npos ) << Entry;

  // As a thumbnail manager runs it: the program from PATH, the fields replaced by quoted words.
  const std::string Input = WriteRecording( "a take with spaces.lvid" );
  const std::string Output = Scratch( "thumb nail.png" ).string();
  std::string Command = Exec;
  boost::replace_all( Command, "%i", ShellQuote( Input ) );
  boost::replace_all( Command, "%o", ShellQuote( Output ) );
  boost::replace_all( Command, "%s", "32" );
  int ExitCode = -1;
  const std::string Out = RunCommand(
      "PATH=" + ShellQuote( ( Prefix() / "bin" ).string() ) + ":/usr/bin:/bin " + Command + " 2>&1", &ExitCode );
  ASSERT_EQ( ExitCode, 0 ) << Command << "\n" << Out;
  EXPECT_EQ( QImage( QString::fromStdString( Output ) ).size(), QSize( 32, 24 ) );
}

TEST( DebianPackage, ControlAndContents )
{
  if( !Have( "dpkg-deb" ) || !Have( "cpack" ) )
    GTEST_SKIP() << "dpkg-deb and cpack are needed";
  const fs::path Folder = fs::temp_directory_path() / fs::unique_path( "lumek-deb-%%%%%%%%" );
  fs::create_directories( Folder );
  int ExitCode = -1;
  const std::string Build =
      RunCommand( "cd " + ShellQuote( Folder.string() ) + " && cpack -G DEB --config " +
                      ShellQuote( std::string( LUMEK_BUILD_DIR ) + "/CPackConfig.cmake" ) + " 2>&1",
                  &ExitCode );
  ASSERT_EQ( ExitCode, 0 ) << Build;
  fs::path Deb;
  for( fs::directory_iterator It( Folder ), End; It != End; ++It )
    if( It->path().extension() == ".deb" )
      Deb = It->path();
  ASSERT_FALSE( Deb.empty() ) << Build;

  const auto Field = [&]( const std::string& i_rName )
  { return boost::trim_copy( RunCommand( "dpkg-deb -f " + ShellQuote( Deb.string() ) + " " + i_rName ) ); };
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
  {
    boost::trim( rPackage );
    RunCommand( "dpkg-query -W " + ShellQuote( rPackage ) + " >/dev/null 2>&1", &ExitCode );
    EXPECT_EQ( ExitCode, 0 ) << rPackage << " is not an installed package";
  }

  const std::string Contents = RunCommand( "dpkg-deb -c " + ShellQuote( Deb.string() ) );
  for( const std::string& rPath :
       { std::string( "./usr/bin/lumekvideoviewer" ), std::string( "./usr/bin/lumekvideotool" ),
         "./usr/share/applications/" + s_AppId + ".desktop", "./usr/share/mime/packages/" + s_AppId + ".xml",
         std::string( "./usr/share/thumbnailers/lumekvideotool.thumbnailer" ),
         "./usr/share/metainfo/" + s_AppId + ".metainfo.xml",
         "./usr/share/icons/hicolor/256x256/apps/" + s_AppId + ".png",
         std::string( "./usr/share/man/man1/lumekvideotool.1.gz" ) } )
    EXPECT_NE( Contents.find( rPath + "\n" ), std::string::npos ) << rPath << "\n" << Contents;
  EXPECT_EQ( Contents.find( "./usr/lib" ), std::string::npos ) << Contents;
  EXPECT_EQ( Contents.find( "./usr/include" ), std::string::npos ) << Contents;

  boost::system::error_code Error;
  fs::remove_all( Folder, Error );
}
