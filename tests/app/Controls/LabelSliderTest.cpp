#include "app/Controls/SliderTicks.h"
#include "app/Controls/VLabelSlider.h"
#include "app/Controls/VProxyStyle.h"
#include "app/Style/AppStyle.h"

#include <QApplication>
#include <QImage>
#include <QSignalSpy>
#include <QTest>
#include <QWheelEvent>
#include <QtTest/qtestspontaneevent.h>

#include <gtest/gtest.h>

#include <cmath>

namespace
{
  using LumekVideoViewer::VLabelSlider;
  using LumekVideoViewer::VProxyStyle;

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

  struct VPaintCase
  {
    const char* Label;
    int Maximum;
    int Width;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VPaintCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class LabelSliderPaint : public testing::TestWithParam< VPaintCase >
  {
  };

  // The marks in the picture sit where frames fall along the handle's travel, computed here from
  // the groove and handle the style reports: long marks at numbered frames, short ones between.
  TEST_P( LabelSliderPaint, MarksWhereTheFramesAre )
  {
    VLabelSlider Slider( Qt::Horizontal );
    Slider.setRange( 0, GetParam().Maximum );
    Slider.resize( GetParam().Width, 40 );
    Slider.setValue( 0 );
    const QImage Image = Slider.grab().toImage();
    const QRect Groove = Slider.GrooveRect();
    const QRect Handle = Slider.HandleRect();
    const QRgb Background = Image.pixel( 0, 0 );

    const int Top = Slider.contentsRect().top();
    const int MinorTop = Groove.y() - 2;
    const int BaseLine = Groove.y() - 2 + Groove.height();
    const int MiddleRow = ( MinorTop + BaseLine ) / 2;
    ASSERT_LT( Top + 6, MinorTop );
    ASSERT_NE( MiddleRow, BaseLine );

    const auto Steps = LumekVideoViewer::ComputeTickSteps( double( GetParam().Maximum ) / Groove.width() );
    EXPECT_DOUBLE_EQ( Slider.GetFramesPerPixel(), double( float( GetParam().Maximum ) / float( Groove.width() ) ) );
    const float Travel = float( Groove.width() - Handle.width() );
    const float Start = float( Handle.width() / 2 );
    auto PositionOf = [&]( int i_Frame ) { return i_Frame * Travel / GetParam().Maximum + Start; };

    int Checked = 0;
    for( int Frame = 0; Frame <= GetParam().Maximum; Frame += Steps.Minor )
    {
      const float X = PositionOf( Frame );
      if( X >= Handle.left() - 1 && X <= Handle.right() + 1 )
        continue;
      const bool bMajor = Frame % Steps.Major == 0;
      EXPECT_TRUE( InkAt( Image, X, MiddleRow, Background ) ) << "frame " << Frame;
      EXPECT_EQ( InkAt( Image, X, Top + 6, Background ), bMajor ) << "frame " << Frame;
      // Nothing between two marks that are far enough apart to have a gap.
      const float Next = PositionOf( Frame + Steps.Minor );
      if( Frame + Steps.Minor <= GetParam().Maximum && Next - X >= 5.0f )
      {
        EXPECT_FALSE( InkAt( Image, ( X + Next ) / 2.0f, MiddleRow, Background ) ) << "after frame " << Frame;
      }
      ++Checked;
    }
    EXPECT_GT( Checked, 0 );
  }

  INSTANTIATE_TEST_SUITE_P( Slider, LabelSliderPaint,
                            testing::Values( VPaintCase{ "NoFileState", 100, 520 },
                                             VPaintCase{ "LongFile", 20000, 800 }, VPaintCase{ "FewFrames", 7, 300 },
                                             VPaintCase{ "TwoFrames", 1, 200 }, VPaintCase{ "OddWidth", 1234, 613 } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( LabelSlider, SingleFrameFilePaintsWithoutComplaint )
  {
    static QStringList s_Messages;
    s_Messages.clear();
    const auto Previous = qInstallMessageHandler(
        []( QtMsgType i_Type, const QMessageLogContext&, const QString& i_rText )
        {
          if( i_Type != QtDebugMsg )
            s_Messages << i_rText;
        } );
    VLabelSlider Slider( Qt::Horizontal );
    Slider.setRange( 0, 0 );
    Slider.resize( 300, 40 );
    (void)Slider.grab();
    qInstallMessageHandler( Previous );
    EXPECT_TRUE( s_Messages.isEmpty() ) << s_Messages.join( "\n" ).toStdString();
    EXPECT_EQ( Slider.GetFramesPerPixel(), 0.0 );
  }

  TEST( LabelSlider, ProgrammaticMoveIsSilentUserMoveIsNot )
  {
    VLabelSlider Slider( Qt::Horizontal );
    Slider.setRange( 0, 100 );
    QSignalSpy Changed( &Slider, &QSlider::valueChanged );
    Slider.setValue( 30 );
    EXPECT_EQ( Slider.value(), 30 );
    EXPECT_EQ( Changed.count(), 0 );
    EXPECT_FALSE( Slider.signalsBlocked() );

    Slider.triggerAction( QAbstractSlider::SliderSingleStepAdd );
    ASSERT_EQ( Changed.count(), 1 );
    EXPECT_EQ( Changed.front().front().toInt(), 31 );
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

    // The slider itself declines the wheel...
    const QPoint Centre = pSlider->rect().center();
    QWheelEvent Direct( Centre, pSlider->mapToGlobal( Centre ), QPoint(), QPoint( 0, 120 ), Qt::NoButton,
                        Qt::NoModifier, Qt::NoScrollPhase, false );
    QApplication::sendEvent( pSlider, &Direct );
    EXPECT_FALSE( Direct.isAccepted() );
    EXPECT_EQ( pSlider->value(), 50 );

    // ...so a wheel turn from the mouse over it reaches the window, which steps the frames.
    QWheelEvent FromMouse( Centre, pSlider->mapToGlobal( Centre ), QPoint(), QPoint( 0, 120 ), Qt::NoButton,
                           Qt::NoModifier, Qt::NoScrollPhase, false );
    // As the window system delivers it: spontaneous, and through notify, which is where Qt hands an
    // ignored wheel on to the parent (sendEvent would clear the flag).
    QSpontaneKeyEvent::setSpontaneous( &FromMouse );
    qApp->notify( pSlider, &FromMouse );
    EXPECT_EQ( pSlider->value(), 50 );
    EXPECT_EQ( Window.Wheels, 1 );
  }

  struct VClickCase
  {
    const char* Label;
    bool bProxy;
    bool bStyleSheet;
    int Expected;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VClickCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class ClickOnGroove : public testing::TestWithParam< VClickCase >
  {
  protected:
    void TearDown() override { qApp->setStyleSheet( QString() ); }
  };

  // The time bar is built as the window builds it: tracking off, the proxy over its own style.
  TEST_P( ClickOnGroove, JumpsThereWithTheProxyStyle )
  {
    if( GetParam().bStyleSheet )
    {
      ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    }
    VLabelSlider Slider( Qt::Horizontal );
    if( GetParam().bProxy )
    {
      auto* pStyle = new VProxyStyle( Slider.style() );
      pStyle->setParent( &Slider );
      Slider.setStyle( pStyle );
    }
    Slider.setTracking( false );
    Slider.setSingleStep( 1 );
    Slider.setPageStep( 10 );
    Slider.setRange( 0, 100 );
    Slider.resize( 420, 40 );
    Slider.show();
    QApplication::processEvents();

    const QRect Groove = Slider.GrooveRect();
    const QRect Handle = Slider.HandleRect();
    const int X = Groove.x() + Handle.width() / 2 + ( Groove.width() - Handle.width() ) * 3 / 4;
    QSignalSpy Changed( &Slider, &QSlider::valueChanged );
    QTest::mouseClick( &Slider, Qt::LeftButton, Qt::NoModifier, QPoint( X, Groove.center().y() ) );
    EXPECT_NEAR( Slider.value(), GetParam().Expected, 1 );
    EXPECT_EQ( Changed.count(), 1 );
  }

  INSTANTIATE_TEST_SUITE_P( Slider, ClickOnGroove,
                            testing::Values( VClickCase{ "ProxyJumps", true, false, 75 },
                                             VClickCase{ "ProxyJumpsUnderTheStyleSheet", true, true, 75 },
                                             VClickCase{ "PlainStylePages", false, false, 10 } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

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
} // namespace
