// The time bar, the frame box and the number editors, built as the window builds them.

#include "tests/app/QtMessages.h"

#include "app/Controls/SliderTicks.h"
#include "app/Controls/VClickSpinBox.h"
#include "app/Controls/VEditSlider.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Controls/VProxyStyle.h"
#include "app/Style/AppStyle.h"

#include <QApplication>
#include <QLineEdit>
#include <QSignalSpy>
#include <QStyleOptionSpinBox>
#include <QTest>
#include <QWheelEvent>

#include <gtest/gtest.h>

#include <cmath>
#include <limits>
#include <memory>
#include <tuple>

using namespace LumekVideoViewer;

namespace
{
  // A gamma-like editor: 0 to 4 in hundredths.
  std::unique_ptr< VEditSlider > MakeEditor( unsigned i_Precision = 2 )
  {
    return std::make_unique< VEditSlider >(
        0.0f, 4.0f, i_Precision, []( float i_Value ) { return static_cast< int >( std::lround( i_Value * 100.0f ) ); },
        []( int i_Position ) { return static_cast< float >( i_Position ) / 100.0f; } );
  }

  // The frame box, with where the style puts its arrows under whatever sheet is in force.
  struct VProbeBox : VClickSpinBox
  {
    QPoint ArrowCentre( QStyle::SubControl i_Arrow ) const
    {
      QStyleOptionSpinBox Option;
      initStyleOption( &Option );
      return style()->subControlRect( QStyle::CC_SpinBox, &Option, i_Arrow, this ).center();
    }
  };
} // namespace

// Worked by hand from the 1-2-5 ladder: the step is the round number of frames that spans 50 to
// 125 pixels.
TEST( TickSteps, RoundStepForTheDensity )
{
  const double NaN = std::numeric_limits< double >::quiet_NaN();
  // Densities that make no sense, each rung of the ladder, and the next decades.
  const std::tuple< double, int, int > Rows[] = { { 0.0, 1, 1 },    { -3.0, 1, 1 },      { NaN, 1, 1 },
                                                  { 0.01, 1, 1 },   { 0.05, 5, 1 },      { 0.2, 20, 2 },
                                                  { 0.5, 50, 5 },   { 1.0, 100, 10 },    { 3.0, 200, 20 },
                                                  { 4.0, 500, 50 }, { 10.0, 1000, 100 }, { 123.4, 10000, 1000 } };
  for( const auto& [FramesPerPixel, Major, Minor] : Rows )
  {
    const VTickSteps Steps = ComputeTickSteps( FramesPerPixel );
    EXPECT_EQ( std::make_pair( Steps.Major, Steps.Minor ), std::make_pair( Major, Minor ) ) << FramesPerPixel;
  }
  // Beyond any file: capped.
  EXPECT_EQ( std::make_pair( ComputeTickSteps( 1e12 ).Major, ComputeTickSteps( 1e12 ).Minor ),
             std::make_pair( std::numeric_limits< int >::max(), std::numeric_limits< int >::max() / 10 ) );
}

// The marks in the picture sit where frames fall along the handle's travel, computed here from
// the groove and handle the style reports: long marks at numbered frames, short ones between.
// A single frame once made the paint divide by a zero range, and Qt complained.
TEST( LabelSlider, PaintsMarksWhereTheFramesAre )
{
  // The no-file state, a long file, few frames, two frames, an odd width, a single frame.
  const std::pair< int, int > Rows[] = { { 100, 520 }, { 20000, 800 }, { 7, 300 },
                                         { 1, 200 },   { 1234, 613 },  { 0, 300 } };
  for( const auto& [Maximum, Width] : Rows )
  {
    SCOPED_TRACE( Maximum );
    const AppTest::VQtMessages Messages;
    VLabelSlider Slider( Qt::Horizontal );
    Slider.setRange( 0, Maximum );
    Slider.resize( Width, 40 );
    const QImage Image = Slider.grab().toImage();
    EXPECT_EQ( Messages.Text(), "" );
    const QRect Groove = Slider.GrooveRect(), Handle = Slider.HandleRect();
    EXPECT_DOUBLE_EQ( Slider.GetFramesPerPixel(), double( float( Maximum ) / float( Groove.width() ) ) );
    if( Maximum == 0 )
      continue;

    // Whether anything was painted at row y in column x or its right neighbour, for a mark at a
    // fractional position.
    auto InkAt = [&]( float i_X, int i_Y )
    {
      const int x = static_cast< int >( std::floor( i_X ) );
      return Image.pixel( x, i_Y ) != Image.pixel( 0, 0 ) ||
             ( x + 1 < Image.width() && Image.pixel( x + 1, i_Y ) != Image.pixel( 0, 0 ) );
    };
    const int Top = Slider.contentsRect().top() + 6;
    const int MiddleRow = Groove.y() - 2 + Groove.height() / 2;
    ASSERT_LT( Top, Groove.y() - 2 );
    const auto Steps = ComputeTickSteps( double( Maximum ) / Groove.width() );
    const float Travel = float( Groove.width() - Handle.width() );
    auto PositionOf = [&]( int i_Frame ) { return i_Frame * Travel / Maximum + float( Handle.width() / 2 ); };
    for( int Frame = 0; Frame <= Maximum; Frame += Steps.Minor )
    {
      const float X = PositionOf( Frame ), Next = PositionOf( Frame + Steps.Minor );
      if( X >= Handle.left() - 1 && X <= Handle.right() + 1 )
        continue;
      EXPECT_TRUE( InkAt( X, MiddleRow ) ) << "frame " << Frame;
      EXPECT_EQ( InkAt( X, Top ), Frame % Steps.Major == 0 ) << "frame " << Frame;
      // Nothing between two marks that are far enough apart to have a gap.
      if( Frame + Steps.Minor <= Maximum && Next - X >= 5.0f )
      {
        EXPECT_FALSE( InkAt( ( X + Next ) / 2.0f, MiddleRow ) ) << "after frame " << Frame;
      }
    }
  }
}

// The time bar and the frame box as the window builds them, with and without the sheet. The
// window moves both while playing: only the user's clicks may reach the seek. With the proxy, a
// click on the groove jumps there rather than a page. The bar declines the wheel, so that Qt
// hands a turn over it on to the window, which steps the frames.
TEST( Controls, WindowMovesAreSilentAndClicksAreHeard )
{
  const std::tuple< bool, QStyle::SubControl, int > Rows[] = { { false, QStyle::SC_SpinBoxUp, 51 },
                                                               { true, QStyle::SC_SpinBoxDown, 49 } };
  for( const auto& [bStyleSheet, Arrow, Stepped] : Rows )
  {
    SCOPED_TRACE( bStyleSheet ? "under the sheet" : "plain style" );
    ASSERT_TRUE( !bStyleSheet || ApplyStyleSheet() );
    VLabelSlider Slider( Qt::Horizontal );
    auto* pStyle = new VProxyStyle( Slider.style() );
    pStyle->setParent( &Slider );
    Slider.setStyle( pStyle );
    Slider.setTracking( false );
    Slider.setPageStep( 10 );
    Slider.setRange( 0, 100 );
    Slider.resize( 420, 40 );
    VProbeBox Box;
    Box.setRange( 0, 100 );
    Box.setMinimumWidth( 70 );
    Slider.show();
    Box.show();
    QApplication::processEvents();
    QSignalSpy SliderChanged( &Slider, &QSlider::valueChanged );
    QSignalSpy BoxChanged( &Box, qOverload< int >( &QSpinBox::valueChanged ) );
    Slider.setValue( 30 );
    Box.setValue( 50 );
    EXPECT_EQ( SliderChanged.count() + BoxChanged.count(), 0 ) << "the window's moves";

    const QRect Groove = Slider.GrooveRect();
    const int Handle = Slider.HandleRect().width();
    const int X = Groove.x() + Handle / 2 + ( Groove.width() - Handle ) * 3 / 4;
    QTest::mouseClick( &Slider, Qt::LeftButton, Qt::NoModifier, QPoint( X, Groove.center().y() ) );
    EXPECT_NEAR( Slider.value(), 75, 1 );
    EXPECT_EQ( SliderChanged.count(), 1 );
    QWheelEvent Wheel( QPointF( X, 5 ), QPointF( X, 5 ), QPoint(), QPoint( 0, 120 ), Qt::NoButton, Qt::NoModifier,
                       Qt::NoScrollPhase, false );
    QApplication::sendEvent( &Slider, &Wheel );
    EXPECT_FALSE( Wheel.isAccepted() );
    QTest::mouseClick( &Box, Qt::LeftButton, Qt::NoModifier, Box.ArrowCentre( Arrow ) );
    ASSERT_EQ( BoxChanged.count(), 1 );
    EXPECT_EQ( BoxChanged.front().front().toInt(), Stepped );
    qApp->setStyleSheet( QString() );
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

// Typing follows on the slider, clamped, and commits on the grid when the edit is finished; the
// file's values are shown without being committed, and wait while the user holds the slider; the
// drag commits on release.
TEST( EditSlider, TypingShowingAndDragging )
{
  // Starting from 1.23: what the slider and the text show after typing, and what is committed.
  const std::tuple< const char*, int, const char*, float > Rows[] = {
      { "abc", 123, "abc", 1.23f }, { "2.5", 250, "2.5", 2.5f }, { "1.234", 123, "1.234", 1.23f },
      { "9", 400, "4", 4.0f },      { "-2", 0, "0", 0.0f },      { "nan", 0, "0", 0.0f },
      { "inf", 400, "4", 4.0f },    { "", 123, "", 1.23f } };
  for( const auto& [Typed, Position, Shown, Committed] : Rows )
  {
    auto pEditor = MakeEditor();
    pEditor->SetText( "1.23" );
    QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
    pEditor->GetLineEdit()->setText( Typed );
    EXPECT_EQ( pEditor->GetSlider()->value(), Position ) << Typed;
    EXPECT_EQ( pEditor->GetText().toStdString(), Shown );
    EXPECT_EQ( Changed.count(), 0 ) << "typing alone commits nothing";
    emit pEditor->GetLineEdit()->editingFinished();
    ASSERT_EQ( Changed.count(), 1 ) << Typed;
    EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), Committed ) << Typed;
  }

  auto pEditor = MakeEditor();
  pEditor->SetText( "1.00" );
  QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
  QSlider* pSlider = pEditor->GetSlider();
  pSlider->setSliderDown( true );
  pSlider->setSliderPosition( 250 );
  pSlider->setSliderPosition( 275 );
  EXPECT_EQ( pEditor->GetText(), "2.75" );
  pEditor->SetText( "3.00" );
  EXPECT_EQ( pSlider->value(), 275 );
  EXPECT_EQ( pEditor->GetText(), "2.75" );
  EXPECT_EQ( Changed.count(), 0 );
  pSlider->setSliderDown( false );
  ASSERT_EQ( Changed.count(), 1 );
  EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), 2.75f );

  pEditor->SetText( "3.5" );
  pEditor->SetText( "xyz" );
  EXPECT_EQ( pSlider->value(), 350 );
  EXPECT_EQ( pEditor->GetText(), "3.50" );
  EXPECT_EQ( Changed.count(), 1 );
  pEditor->SetMaximum( "2" );
  pEditor->SetMaximum( "two" );
  EXPECT_EQ( pSlider->maximum(), 200 );

  // Fixed notation at every precision, never an exponent.
  EXPECT_EQ( MakeEditor( 0 )->NumberText( 1.7f ), "2" );
  EXPECT_EQ( MakeEditor( VEditSlider::DefaultPrecision )->NumberText( 1.5f ), "1.500000" );
  EXPECT_EQ( MakeEditor( 1 )->NumberText( 123456.0f ), "123456.0" );
}
