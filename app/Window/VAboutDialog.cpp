#include "app/Window/VAboutDialog.h"

#include "app/Window/VideoWindowLogic.h"
#include "services/DebugServices.h"

#include <QHBoxLayout>
#include <QLabel>
#include <QPushButton>
#include <QVBoxLayout>

#include <csignal>

namespace LumekVideoViewer
{
  VAboutDialog::VAboutDialog( bool i_bDeveloper, QWidget* i_pParent ) : QDialog( i_pParent )
  {
    setWindowFlags( windowFlags() & ~Qt::WindowContextHelpButtonHint );
    setWindowTitle( QString( "About %1" ).arg( ApplicationDisplayName ) );
    setObjectName( "AboutDialog" );

    QLabel* pLogo = new QLabel( this );
    pLogo->setObjectName( "AboutLogo" );
    pLogo->setPixmap( QPixmap( ":com.Lumek.LumekVideoViewer.AboutLogo.svg" ) );
    pLogo->setAlignment( Qt::AlignCenter );

    QVBoxLayout* pLayout = new QVBoxLayout( this );
    pLayout->addWidget( pLogo );
    if( const ZOL::IApplicationVersion* pVersion = DebugServices::ApplicationVersion() )
    {
      QLabel* pVersionLine = new QLabel( AboutVersionLine( *pVersion ), this );
      pVersionLine->setObjectName( "VersionLine" );
      QFont Bold = pVersionLine->font();
      Bold.setBold( true );
      pVersionLine->setFont( Bold );
      pLayout->addWidget( pVersionLine );
      QLabel* pBranch = new QLabel( pVersion->Branch, this );
      pBranch->setObjectName( "Branch" );
      pLayout->addWidget( pBranch );
      QLabel* pRevision = new QLabel( AboutRevisionLine( *pVersion ), this );
      pRevision->setObjectName( "Revision" );
      pLayout->addWidget( pRevision );
      pLayout->addWidget( new QLabel( pVersion->Copyright, this ) );
    }

    QHBoxLayout* pButtons = new QHBoxLayout;
    pButtons->addStretch( 1 );
    if( i_bDeveloper )
    {
      QPushButton* pCrash = new QPushButton( "Crash", this );
      connect( pCrash, &QPushButton::clicked, this, [] { std::raise( SIGSEGV ); } );
      pButtons->addWidget( pCrash );
      QPushButton* pAssert = new QPushButton( "AssertFail", this );
      connect( pAssert, &QPushButton::clicked, this,
               [] { DebugServices::CallAssertFailHandler( "AssertFail button", __FILE__, __LINE__ ); } );
      pButtons->addWidget( pAssert );
    }
    QPushButton* pClose = new QPushButton( "Close", this );
    pClose->setDefault( true );
    connect( pClose, &QPushButton::clicked, this, &QDialog::accept );
    pButtons->addWidget( pClose );
    pLayout->addLayout( pButtons );
  }
} // namespace LumekVideoViewer
