// The time bar, the frame box and the number editors, built as the window builds them.

#include "tests/app/QtMessages.h"

#include "app/Controls/SliderTicks.h"
#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VEditSlider.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Controls/VProxyStyle.h"
#include "app/Style/AppStyle.h"

#include <QApplication>
#include <QImage>
#include <QLineEdit>
#include <QSignalSpy>
#include <QStyleOptionSpinBox>
#include <QTest>
#include <QWheelEvent>
#include <QtTest/qtestspontaneevent.h>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <tuple>

using namespace LumekVideoViewer;

namespace
{
  // Whether anything was painted in column x (or its right neighbour, for a mark at a fractional
  // position) at row y.
  bool InkAt( const QImage& i_rImage, float i_X, int i_Y, QRgb i_Background )
  {
    const int x = static_cast< int >( std::floor( i_X ) );
    for( int Column : { x, x + 1 } )
      if( Column >= 0 && Column < i_rImage.width() && i_rImage.pixel( Column, i_Y ) != i_Background )
        return true;
    return false;
  }

  // The application's sheet for a row that asks for it, and none after it.
  struct VStyleSheetFor
  {
    explicit VStyleSheetFor( bool i_bApply ) { EXPECT_TRUE( !i_bApply || ApplyStyleSheet() ); }
    ~VStyleSheetFor() { qApp->setStyleSheet( QString() ); }
  };

  // A gamma-like editor: 0 to 4 in hundredths.
  std::unique_ptr< VEditSlider > MakeEditor( unsigned i_Precision = 2 )
  {
    return std::make_unique< VEditSlider >(
        0.0f, 4.0f, i_Precision, []( float i_Value ) { return static_cast< int >( std::lround( i_Value * 100.0f ) ); },
        []( int i_Position ) { return static_cast< float >( i_Position ) / 100.0f; } );
  }
} // namespace

// Worked by hand from the 1-2-5 ladder: the step is the round number of frames that spans 50 to
// 125 pixels.
TEST( TickSteps, RoundStepForTheDensity )
{
  const double NaN = std::numeric_limits< double >::quiet_NaN();
  const std::tuple< double, int, int > Rows[] = { { 0.0, 1, 1 },    { -3.0, 1, 1 },        { NaN, 1, 1 },
                                                  { 0.05, 5, 1 },   { 0.2, 20, 2 },        { 3.0, 200, 20 },
                                                  { 4.0, 500, 50 }, { 123.4, 10000, 1000 } };
  for( const auto& [FramesPerPixel, Major, Minor] : Rows )
  {
    const VTickSteps Steps = ComputeTickSteps( FramesPerPixel );
    EXPECT_EQ( std::make_pair( Steps.Major, Steps.Minor ), std::make_pair( Major, Minor ) ) << FramesPerPixel;
  }
  // Beyond any file: capped.
  EXPECT_EQ( ComputeTickSteps( 1e12 ).Major, std::numeric_limits< int >::max() );
  EXPECT_EQ( ComputeTickSteps( 1e12 ).Minor, std::numeric_limits< int >::max() / 10 );

  for( int k = -300; k <= 600; ++k )
  {
    const double FramesPerPixel = std::pow( 10.0, k / 100.0 );
    const VTickSteps Steps = ComputeTickSteps( FramesPerPixel );
    if( Steps.Major == 1 )
      continue;
    const double Pixels = Steps.Major / FramesPerPixel;
    EXPECT_TRUE( Pixels >= 50.0 && Pixels <= 125.0 ) << FramesPerPixel;
    // A round number: 1, 2 or 5 times a power of ten.
    int Mantissa = Steps.Major;
    while( Mantissa % 10 == 0 )
      Mantissa /= 10;
    EXPECT_TRUE( Mantissa == 1 || Mantissa == 2 || Mantissa == 5 ) << Steps.Major;
    EXPECT_EQ( Steps.Minor, Steps.Major > 10 ? Steps.Major / 10 : 1 );
  }
}

// The marks in the picture sit where frames fall along the handle's travel, computed here from
// the groove and handle the style reports: long marks at numbered frames, short ones between.
TEST( LabelSlider, PaintsMarksWhereTheFramesAre )
{
  // The no-file state, a long file, few frames, two frames, an odd width.
  const std::pair< int, int > Rows[] = { { 100, 520 }, { 20000, 800 }, { 7, 300 }, { 1, 200 }, { 1234, 613 } };
  for( const auto& [Maximum, Width] : Rows )
  {
    SCOPED_TRACE( Maximum );
    VLabelSlider Slider( Qt::Horizontal );
    Slider.setRange( 0, Maximum );
    Slider.resize( Width, 40 );
    const QImage Image = Slider.grab().toImage();
    const QRect Groove = Slider.GrooveRect();
    const QRect Handle = Slider.HandleRect();
    const QRgb Background = Image.pixel( 0, 0 );

    const int Top = Slider.contentsRect().top();
    const int MinorTop = Groove.y() - 2;
    const int MiddleRow = ( MinorTop + MinorTop + Groove.height() ) / 2;
    ASSERT_LT( Top + 6, MinorTop );

    const auto Steps = ComputeTickSteps( double( Maximum ) / Groove.width() );
    EXPECT_DOUBLE_EQ( Slider.GetFramesPerPixel(), double( float( Maximum ) / float( Groove.width() ) ) );
    const float Travel = float( Groove.width() - Handle.width() );
    auto PositionOf = [&]( int i_Frame ) { return i_Frame * Travel / Maximum + float( Handle.width() / 2 ); };

    int Checked = 0;
    for( int Frame = 0; Frame <= Maximum; Frame += Steps.Minor )
    {
      const float X = PositionOf( Frame );
      if( X >= Handle.left() - 1 && X <= Handle.right() + 1 )
        continue;
      EXPECT_TRUE( InkAt( Image, X, MiddleRow, Background ) ) << "frame " << Frame;
      EXPECT_EQ( InkAt( Image, X, Top + 6, Background ), Frame % Steps.Major == 0 ) << "frame " << Frame;
      // Nothing between two marks that are far enough apart to have a gap.
      const float Next = PositionOf( Frame + Steps.Minor );
      if( Frame + Steps.Minor <= Maximum && Next - X >= 5.0f )
      {
        EXPECT_FALSE( InkAt( Image, ( X + Next ) / 2.0f, MiddleRow, Background ) ) << "after frame " << Frame;
      }
      ++Checked;
    }
    EXPECT_GT( Checked, 0 );
  }
}

// A file of one frame once made the paint divide by a zero range, and Qt complained.
TEST( LabelSlider, SingleFrameFilePaintsWithoutComplaint )
{
  const AppTest::VQtMessages Messages;
  VLabelSlider Slider( Qt::Horizontal );
  Slider.setRange( 0, 0 );
  Slider.resize( 300, 40 );
  (void)Slider.grab();
  EXPECT_EQ( Messages.Text(), "" );
  EXPECT_EQ( Slider.GetFramesPerPixel(), 0.0 );
}

TEST( LabelSlider, WheelGoesToTheWindow )
{
  struct VWindow : QWidget
  {
    int Wheels = 0;
    void wheelEvent( QWheelEvent* i_pEvent ) override
    {
      ++Wheels;
      i_pEvent->accept();
    }
  } Window;
  auto* pSlider = new VLabelSlider( Qt::Horizontal, &Window );
  pSlider->setRange( 0, 100 );
  pSlider->setValue( 50 );
  pSlider->setGeometry( 10, 10, 200, 30 );
  Window.resize( 220, 50 );
  Window.show();
  ASSERT_TRUE( QTest::qWaitForWindowExposed( &Window ) );

  // The slider declines the wheel, so a turn from the mouse over it reaches the window, which
  // steps the frames. As the window system delivers it: spontaneous, and through notify, which is
  // where Qt hands an ignored wheel on to the parent (sendEvent would clear the flag).
  const QPoint Centre = pSlider->rect().center();
  QWheelEvent FromMouse( Centre, pSlider->mapToGlobal( Centre ), QPoint(), QPoint( 0, 120 ), Qt::NoButton,
                         Qt::NoModifier, Qt::NoScrollPhase, false );
  QSpontaneKeyEvent::setSpontaneous( &FromMouse );
  qApp->notify( pSlider, &FromMouse );
  EXPECT_EQ( pSlider->value(), 50 );
  EXPECT_EQ( Window.Wheels, 1 );
}

// The time bar as the window builds it: tracking off, the proxy over its own style. The window
// moves the bar while playing: only the user's click may reach the seek.
TEST( LabelSlider, AClickOnTheGrooveJumpsThereWithTheProxyStyle )
{
  const std::tuple< const char*, bool, bool, int > Rows[] = { { "ProxyJumps", true, false, 75 },
                                                              { "ProxyJumpsUnderTheStyleSheet", true, true, 75 },
                                                              { "PlainStylePages", false, false, 40 } };
  for( const auto& [Name, bProxy, bStyleSheet, Expected] : Rows )
  {
    SCOPED_TRACE( Name );
    const VStyleSheetFor Sheet( bStyleSheet );
    VLabelSlider Slider( Qt::Horizontal );
    if( bProxy )
    {
      auto* pStyle = new VProxyStyle( Slider.style() );
      pStyle->setParent( &Slider );
      Slider.setStyle( pStyle );
    }
    Slider.setTracking( false );
    Slider.setPageStep( 10 );
    Slider.setRange( 0, 100 );
    Slider.resize( 420, 40 );
    Slider.show();
    QApplication::processEvents();
    QSignalSpy Changed( &Slider, &QSlider::valueChanged );
    Slider.setValue( 30 );
    EXPECT_EQ( Changed.count(), 0 ) << "the window's move";

    const QRect Groove = Slider.GrooveRect();
    const int Handle = Slider.HandleRect().width();
    const int X = Groove.x() + Handle / 2 + ( Groove.width() - Handle ) * 3 / 4;
    QTest::mouseClick( &Slider, Qt::LeftButton, Qt::NoModifier, QPoint( X, Groove.center().y() ) );
    EXPECT_NEAR( Slider.value(), Expected, 1 );
    EXPECT_EQ( Changed.count(), 1 );
  }
}

// A proxy that took ownership of the application's style would delete it with the time bar.
TEST( ProxyStyle, LeavesTheApplicationStyleAlone )
{
  QStyle* pApplicationStyle = QApplication::style();
  QObject* pOwner = pApplicationStyle->parent();
  {
    VProxyStyle Proxy( pApplicationStyle );
    EXPECT_EQ( Proxy.styleHint( QStyle::SH_Slider_AbsoluteSetButtons ), int( Qt::LeftButton ) );
    EXPECT_EQ( pApplicationStyle->parent(), pOwner );
    EXPECT_EQ( pApplicationStyle->proxy(), pApplicationStyle );
  }
  // Still alive and still answering for everyone else.
  EXPECT_EQ( QApplication::style(), pApplicationStyle );
  EXPECT_NE( pApplicationStyle->styleHint( QStyle::SH_Slider_AbsoluteSetButtons ), int( Qt::LeftButton ) );
}

// The frame box as the window builds it: its own moves are silent, a click on an arrow is the
// user's request and is heard.
TEST( SpinBox, AClickOnAnArrowStepsOneFrame )
{
  // Where the style puts the arrows of this box, under whatever sheet is in force.
  struct VProbe : VClickSpinBox
  {
    QPoint ArrowCentre( QStyle::SubControl i_Arrow ) const
    {
      QStyleOptionSpinBox Option;
      initStyleOption( &Option );
      return style()->subControlRect( QStyle::CC_SpinBox, &Option, i_Arrow, this ).center();
    }
  };
  const std::tuple< bool, QStyle::SubControl, int > Rows[] = { { false, QStyle::SC_SpinBoxUp, 51 },
                                                               { true, QStyle::SC_SpinBoxDown, 49 } };
  for( const auto& [bStyleSheet, Arrow, Expected] : Rows )
  {
    SCOPED_TRACE( bStyleSheet ? "under the sheet" : "plain style" );
    const VStyleSheetFor Sheet( bStyleSheet );
    VProbe Box;
    Box.setRange( 0, 100 );
    Box.setMinimumWidth( 70 );
    QSignalSpy Changed( &Box, qOverload< int >( &QSpinBox::valueChanged ) );
    Box.setValue( 50 );
    EXPECT_EQ( Box.text(), "50" );
    EXPECT_EQ( Changed.count(), 0 ) << "the window's move";
    Box.show();
    QApplication::processEvents();
    QTest::mouseClick( &Box, Qt::LeftButton, Qt::NoModifier, Box.ArrowCentre( Arrow ) );
    ASSERT_EQ( Changed.count(), 1 );
    EXPECT_EQ( Changed.front().front().toInt(), Expected );
  }
}

// Starting from 1.23: what the slider and the text show after typing, and what finishing the
// edit commits.
TEST( EditSlider, TypingClampsFollowsAndCommitsOnTheGrid )
{
  const std::tuple< const char*, int, const char*, float > Rows[] = {
      { "abc", 123, "abc", 1.23f }, { "2.5", 250, "2.5", 2.5f }, { "1.234", 123, "1.234", 1.23f },
      { "9", 400, "4", 4.0f },      { "-2", 0, "0", 0.0f },      { "nan", 0, "0", 0.0f },
      { "inf", 400, "4", 4.0f },    { "", 123, "", 1.23f } };
  for( const auto& [Typed, Position, Shown, Committed] : Rows )
  {
    SCOPED_TRACE( Typed );
    auto pEditor = MakeEditor();
    pEditor->SetText( "1.23" );
    QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
    pEditor->GetLineEdit()->setText( Typed );
    EXPECT_EQ( pEditor->GetSlider()->value(), Position );
    EXPECT_EQ( pEditor->GetText().toStdString(), Shown );
    EXPECT_EQ( Changed.count(), 0 ) << "typing alone commits nothing";

    emit pEditor->GetLineEdit()->editingFinished();
    ASSERT_EQ( Changed.count(), 1 );
    EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), Committed );
  }
}

TEST( EditSlider, DragShowsTheNumberAndCommitsOnRelease )
{
  auto pEditor = MakeEditor();
  pEditor->SetText( "1.00" );
  QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
  QSlider* pSlider = pEditor->GetSlider();
  pSlider->setSliderDown( true );
  pSlider->setSliderPosition( 250 );
  pSlider->setSliderPosition( 275 );
  EXPECT_EQ( pEditor->GetText(), "2.75" );
  // The file's value arriving meanwhile waits for the user's hand.
  pEditor->SetText( "3.00" );
  EXPECT_EQ( pSlider->value(), 275 );
  EXPECT_EQ( pEditor->GetText(), "2.75" );
  EXPECT_EQ( Changed.count(), 0 );

  pSlider->setSliderDown( false );
  ASSERT_EQ( Changed.count(), 1 );
  EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), 2.75f );
}

TEST( EditSlider, SetTextAndSetMaximumShowWithoutCommitting )
{
  auto pEditor = MakeEditor();
  QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
  pEditor->SetText( "3.5" );
  pEditor->SetText( "xyz" );
  EXPECT_EQ( pEditor->GetSlider()->value(), 350 );
  EXPECT_EQ( pEditor->GetText(), "3.50" );
  EXPECT_EQ( Changed.count(), 0 );
  pEditor->SetMaximum( "2" );
  pEditor->SetMaximum( "two" );
  EXPECT_EQ( pEditor->GetSlider()->maximum(), 200 );

  // Fixed notation at every precision, never an exponent.
  EXPECT_EQ( MakeEditor( 0 )->NumberText( 1.7f ), "2" );
  EXPECT_EQ( MakeEditor( VEditSlider::DefaultPrecision )->NumberText( 1.5f ), "1.500000" );
  EXPECT_EQ( MakeEditor( 1 )->NumberText( 123456.0f ), "123456.0" );
}
