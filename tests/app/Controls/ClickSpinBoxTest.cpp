#include "app/Controls/VClickSpinBox.h"
#include "app/Style/AppStyle.h"

#include <QApplication>
#include <QSignalSpy>
#include <QStyleOptionSpinBox>
#include <QTest>

#include <gtest/gtest.h>

namespace
{
  using LumekVideoViewer::VClickSpinBox;

  // Where the style puts the arrows of this box, under whatever sheet is in force.
  class VSpinBoxProbe : public VClickSpinBox
  {
  public:
    QPoint ArrowCentre( QStyle::SubControl i_Arrow ) const
    {
      QStyleOptionSpinBox Option;
      initStyleOption( &Option );
      return style()->subControlRect( QStyle::CC_SpinBox, &Option, i_Arrow, this ).center();
    }
  };

  struct VArrowCase
  {
    const char* Label;
    bool bStyleSheet;
    int Start;
    QStyle::SubControl Arrow;
    int Expected;
    int Signals;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VArrowCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class SpinBoxArrow : public testing::TestWithParam< VArrowCase >
  {
  protected:
    void TearDown() override { qApp->setStyleSheet( QString() ); }
  };

  // The frame box as the window builds it: a click on an arrow is the user's request and is heard.
  TEST_P( SpinBoxArrow, ClickStepsOneFrame )
  {
    if( GetParam().bStyleSheet )
    {
      ASSERT_TRUE( LumekVideoViewer::ApplyStyleSheet() );
    }
    VSpinBoxProbe Box;
    Box.setRange( 0, 100 );
    Box.setMinimumWidth( 70 );
    Box.setValue( GetParam().Start );
    Box.show();
    QApplication::processEvents();
    QSignalSpy Changed( &Box, qOverload< int >( &QSpinBox::valueChanged ) );
    QTest::mouseClick( &Box, Qt::LeftButton, Qt::NoModifier, Box.ArrowCentre( GetParam().Arrow ) );
    EXPECT_EQ( Box.value(), GetParam().Expected );
    ASSERT_EQ( Changed.count(), GetParam().Signals );
    if( GetParam().Signals )
    {
      EXPECT_EQ( Changed.front().front().toInt(), GetParam().Expected );
    }
  }

  INSTANTIATE_TEST_SUITE_P(
      SpinBox, SpinBoxArrow,
      testing::Values( VArrowCase{ "UpPlainStyle", false, 50, QStyle::SC_SpinBoxUp, 51, 1 },
                       VArrowCase{ "DownUnderTheStyleSheet", true, 50, QStyle::SC_SpinBoxDown, 49, 1 },
                       VArrowCase{ "UpAtTheLastFrameStays", true, 100, QStyle::SC_SpinBoxUp, 100, 0 },
                       VArrowCase{ "DownAtFrameZeroStays", true, 0, QStyle::SC_SpinBoxDown, 0, 0 } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( SpinBox, ProgrammaticMoveIsSilent )
  {
    VClickSpinBox Box;
    Box.setRange( 0, 100 );
    QSignalSpy Changed( &Box, qOverload< int >( &QSpinBox::valueChanged ) );
    Box.setValue( 42 );
    EXPECT_EQ( Box.value(), 42 );
    EXPECT_EQ( Box.text(), "42" );
    EXPECT_EQ( Changed.count(), 0 );
    EXPECT_FALSE( Box.signalsBlocked() );
  }
} // namespace
