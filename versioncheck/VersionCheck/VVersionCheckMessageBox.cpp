#include "versioncheck/VersionCheck/VVersionCheckMessageBox.h"

#include <QCheckBox>
#include <QDesktopServices>
#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QStyle>
#include <QTextBrowser>
#include <QUrl>
#include <QVBoxLayout>

namespace VersionCheck
{
  namespace
  {
    // The server's page is shown as part of the dialog, not as a document: no frame, the dialog's
    // background and its window text colour.
    void StyleAsDialogText( QTextBrowser& io_rBrowser, const QPalette& i_rDialogPalette )
    {
      io_rBrowser.setOpenLinks( false );
      io_rBrowser.setFrameStyle( QFrame::NoFrame | QFrame::Plain );
      io_rBrowser.setBackgroundRole( QPalette::Window );
      QPalette Palette = i_rDialogPalette;
      const QBrush Text( i_rDialogPalette.color( QPalette::WindowText ), Qt::SolidPattern );
      for( const auto Group : { QPalette::Active, QPalette::Inactive, QPalette::Disabled } )
        Palette.setBrush( Group, QPalette::Text, Text );
      io_rBrowser.setPalette( Palette );
      io_rBrowser.setStyleSheet( "QTextBrowser { background-color: transparent; border: none; }" );
    }

    QLabel* MakeIcon( const QStyle& i_rStyle, bool i_bError, QWidget* i_pParent )
    {
      const QIcon Icon =
          i_rStyle.standardIcon( i_bError ? QStyle::SP_MessageBoxCritical : QStyle::SP_MessageBoxInformation );
      const int Size = i_rStyle.pixelMetric( QStyle::PM_MessageBoxIconSize );
      auto* pLabel = new QLabel( i_pParent );
      pLabel->setPixmap( Icon.pixmap( Size, Size ) );
      return pLabel;
    }
  } // namespace

  VVersionCheckMessageBox::VVersionCheckMessageBox( bool i_bCheckBox, const QString& i_rName, QWidget* i_pParent,
                                                    bool i_bError )
      : QDialog( i_pParent ), m_bError( i_bError )
  {
    setWindowTitle( QStringLiteral( "Checking %1 Version" ).arg( i_rName ) );
    setWindowFlags( windowFlags() & ~Qt::WindowContextHelpButtonHint );

    m_pTextBrowser = new QTextBrowser( this );
    StyleAsDialogText( *m_pTextBrowser, palette() );
    auto* pButton = new QPushButton( "OK", this );

    auto* pIconColumn = new QVBoxLayout;
    pIconColumn->addWidget( MakeIcon( *style(), i_bError, this ) );
    pIconColumn->addStretch();
    auto* pMessageRow = new QHBoxLayout;
    pMessageRow->addLayout( pIconColumn );
    pMessageRow->addWidget( m_pTextBrowser );
    auto* pButtonRow = new QHBoxLayout;
    pButtonRow->addStretch();
    pButtonRow->addWidget( pButton );
    pButtonRow->addStretch();

    auto* pLayout = new QVBoxLayout( this );
    pLayout->addLayout( pMessageRow );
    pLayout->addStretch( 1 );
    pLayout->addLayout( pButtonRow );
    if( i_bCheckBox )
    {
      m_pCheckBox = new QCheckBox( "Do not show this message again.", this );
      pLayout->addWidget( m_pCheckBox );
    }

    connect( m_pTextBrowser, &QTextBrowser::anchorClicked, this, &VVersionCheckMessageBox::handleAnchorClicked );
    connect( pButton, &QPushButton::clicked, this, &QDialog::close );
  }

  void VVersionCheckMessageBox::handleAnchorClicked( const QUrl& i_rUrl )
  {
    QDesktopServices::openUrl( i_rUrl );
  }
} // namespace VersionCheck
