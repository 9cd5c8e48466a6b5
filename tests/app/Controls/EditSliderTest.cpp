#include "app/Controls/VEditSlider.h"

#include <QLineEdit>
#include <QSignalSpy>
#include <QSlider>

#include <gtest/gtest.h>

#include <cmath>
#include <memory>

namespace
{
  using LumekVideoViewer::VEditSlider;

  // A gamma-like editor: 0 to 4 in hundredths.
  std::unique_ptr< VEditSlider > MakeEditor( unsigned i_Precision = 2 )
  {
    return std::make_unique< VEditSlider >(
        0.0f, 4.0f, i_Precision, []( float i_Value ) { return static_cast< int >( std::lround( i_Value * 100.0f ) ); },
        []( int i_Position ) { return static_cast< float >( i_Position ) / 100.0f; } );
  }

  struct VTypingCase
  {
    const char* Label;
    const char* Typed;
    int Position;
    const char* Shown;
    float Committed;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VTypingCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class EditSliderTyping : public testing::TestWithParam< VTypingCase >
  {
  };

  // Starting from 1.23: what the slider and the text show after typing, and what finishing the
  // edit commits.
  TEST_P( EditSliderTyping, ClampsFollowsAndCommitsOnTheGrid )
  {
    auto pEditor = MakeEditor();
    pEditor->SetText( "1.23" );
    QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );

    pEditor->GetLineEdit()->setText( GetParam().Typed );
    EXPECT_EQ( pEditor->GetSlider()->value(), GetParam().Position );
    EXPECT_EQ( pEditor->GetText().toStdString(), GetParam().Shown );
    EXPECT_EQ( Changed.count(), 0 ) << "typing alone commits nothing";

    emit pEditor->GetLineEdit()->editingFinished();
    ASSERT_EQ( Changed.count(), 1 );
    EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), GetParam().Committed );
  }

  INSTANTIATE_TEST_SUITE_P( EditSlider, EditSliderTyping,
                            testing::Values( VTypingCase{ "NotANumberChangesNothing", "abc", 123, "abc", 1.23f },
                                             VTypingCase{ "InRange", "2.5", 250, "2.5", 2.5f },
                                             VTypingCase{ "RoundedToTheGrid", "1.234", 123, "1.234", 1.23f },
                                             VTypingCase{ "AboveTheMaximum", "9", 400, "4", 4.0f },
                                             VTypingCase{ "BelowTheMinimum", "-2", 0, "0", 0.0f },
                                             VTypingCase{ "NaNCountsAsBelow", "nan", 0, "0", 0.0f },
                                             VTypingCase{ "InfinityIsAboveTheMaximum", "inf", 400, "4", 4.0f },
                                             VTypingCase{ "EmptyChangesNothing", "", 123, "", 1.23f } ),
                            []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

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
    EXPECT_EQ( Changed.count(), 0 );

    pSlider->setSliderDown( false );
    ASSERT_EQ( Changed.count(), 1 );
    EXPECT_FLOAT_EQ( Changed.front().front().toFloat(), 2.75f );
  }

  TEST( EditSlider, SetTextShowsWithoutCommitting )
  {
    auto pEditor = MakeEditor();
    QSignalSpy Changed( pEditor.get(), &VEditSlider::Changed );
    pEditor->SetText( "3.5" );
    EXPECT_EQ( pEditor->GetSlider()->value(), 350 );
    EXPECT_EQ( pEditor->GetText(), "3.50" );
    pEditor->SetText( "xyz" );
    EXPECT_EQ( pEditor->GetSlider()->value(), 350 );
    EXPECT_EQ( pEditor->GetText(), "3.50" );
    EXPECT_EQ( Changed.count(), 0 );
  }

  TEST( EditSlider, SetTextWaitsForTheUsersHand )
  {
    auto pEditor = MakeEditor();
    pEditor->SetText( "1.00" );
    pEditor->GetSlider()->setSliderDown( true );
    pEditor->SetText( "3.00" );
    EXPECT_EQ( pEditor->GetSlider()->value(), 100 );
    EXPECT_EQ( pEditor->GetText(), "1.00" );
  }

  struct VPrecisionCase
  {
    const char* Label;
    unsigned Precision;
    float Value;
    const char* Text;
  };

  std::ostream& operator<<( std::ostream& io_rStream, const VPrecisionCase& i_rCase )
  {
    return io_rStream << i_rCase.Label;
  }

  class EditSliderNumberText : public testing::TestWithParam< VPrecisionCase >
  {
  };

  TEST_P( EditSliderNumberText, FixedNotation )
  {
    EXPECT_EQ( MakeEditor( GetParam().Precision )->NumberText( GetParam().Value ).toStdString(), GetParam().Text );
  }

  INSTANTIATE_TEST_SUITE_P(
      EditSlider, EditSliderNumberText,
      testing::Values( VPrecisionCase{ "TwoPlaces", 2, 1.5f, "1.50" }, VPrecisionCase{ "NoPlacesRounds", 0, 1.7f, "2" },
                       VPrecisionCase{ "DefaultPrecisionIsSix", VEditSlider::DefaultPrecision, 1.5f, "1.500000" },
                       VPrecisionCase{ "LargeValueNoExponent", 1, 123456.0f, "123456.0" } ),
      []( const auto& i_rInfo ) { return std::string( i_rInfo.param.Label ); } );

  TEST( EditSlider, SetMaximumMovesTheSlidersEnd )
  {
    auto pEditor = MakeEditor();
    pEditor->SetMaximum( "2" );
    EXPECT_EQ( pEditor->GetSlider()->maximum(), 200 );
    pEditor->SetMaximum( "two" );
    EXPECT_EQ( pEditor->GetSlider()->maximum(), 200 );
  }
} // namespace
