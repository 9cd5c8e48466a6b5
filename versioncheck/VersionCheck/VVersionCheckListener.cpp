#include "versioncheck/VersionCheck/VVersionCheckListener.h"

#include "versioncheck/VersionCheck/VVersionCheckMessageBox.h"
#include "versioncheck/VersionReply/DefaultServer.h"
#include "versioncheck/VersionReply/VersionReply.h"

#include <QCheckBox>
#include <QNetworkReply>
#include <QTextBrowser>

namespace VersionCheck
{
  namespace
  {
    // Outcome codes that are not the network's own.
    constexpr int StatusTimeout = 4;
    constexpr int StatusNoReply = 99;
  } // namespace

  VVersionCheckListener::VVersionCheckListener( const QString& i_rName, bool i_bStartupCheck,
                                                std::shared_ptr< IVersionCheckSettings > i_pSettings,
                                                QWidget* i_pDialogParent, VDialogRunner i_DialogRunner,
                                                QObject* i_pParent )
      : QObject( i_pParent ), m_Name( i_rName ), m_bStartupCheck( i_bStartupCheck ),
        m_pSettings( std::move( i_pSettings ) ), m_pDialogParent( i_pDialogParent ),
        m_DialogRunner( std::move( i_DialogRunner ) )
  {
  }

  void VVersionCheckListener::OnReplyFinished()
  {
    m_bFinished = true;
    auto* pReply = qobject_cast< QNetworkReply* >( sender() );
    if( pReply == nullptr )
    {
      m_pSettings->Report( StatusNoReply, "", "NONE", "Unknown error" );
      return;
    }
    // A reply cut off for its size is closed already and has nothing more to give.
    const std::string Body = pReply->isOpen() ? QString::fromUtf8( pReply->readAll() ).toStdString() : std::string();
    const std::string ErrorText = pReply->errorString().toStdString();
    const int Status = pReply->error();
    pReply->deleteLater();

    if( Status != QNetworkReply::NoError )
    {
      // Nothing at start depends on the server: only a user who asked hears that it failed.
      if( !m_bStartupCheck )
        ShowConnectionError();
      Finish( Status, Body, "NONE", ErrorText );
      return;
    }
    HandleReply( Body, Status, ErrorText );
  }

  void VVersionCheckListener::HandleReply( const std::string& i_rBody, int i_Status, const std::string& i_rErrorText )
  {
    IVersionReply Reply;
    std::string ParseError;
    if( !ParseVersionReply( i_rBody, Reply, ParseError ) )
    {
      Finish( i_Status, i_rBody, "NONE", ParseError );
      return;
    }

    const bool bNewMessage = m_pSettings->GetMessageId() != Reply.Id;
    m_pSettings->SetMessageId( Reply.Id );
    // A new message undoes "Do not show this message again." for the old one.
    if( bNewMessage )
      m_pSettings->SetShowOnStartup( true );

    if( Reply.CheckVersion == "2.0" )
    {
      // This format is answered by silence: no outcome and no completion.
      deleteLater();
      return;
    }
    if( Reply.CheckVersion == "3.0" )
    {
      if( !m_bStartupCheck || m_pSettings->GetShowOnStartup() || bNewMessage )
      {
        emit WhitelistUpdated( Reply.Whitelist );
        emit VersionUpdated( Reply.ProductVersion );
      }
    }
    else if( Reply.CheckVersion == "1.0" )
    {
      emit VersionUpdated( Reply.ProductVersion );
      const QString Html = QString::fromStdString( i_rBody );
      if( !m_bStartupCheck )
        ShowMessage( Html, EBox::Plain, false );
      else if( Reply.MessageType == "REQUIRED" )
        ShowMessage( Html, EBox::Plain, false );
      else if( Reply.MessageType == "OPTIONAL" && ( m_pSettings->GetShowOnStartup() || bNewMessage ) )
        m_pSettings->SetShowOnStartup( !ShowMessage( Html, EBox::WithCheckBox, false ) );
    }
    Finish( i_Status, i_rBody, Reply.MessageType, i_rErrorText );
  }

  void VVersionCheckListener::OnTimeout()
  {
    if( m_bFinished )
      return;
    // The request itself runs on; its late finished() finds no listener any more.
    m_pSettings->Report( StatusTimeout, "", "NONE", "Version check request timeout" );
    deleteLater();
  }

  bool VVersionCheckListener::ShowMessage( const QString& i_rHtml, EBox i_Box, bool i_bError )
  {
    VVersionCheckMessageBox Box( i_Box == EBox::WithCheckBox, m_Name, m_pDialogParent, i_bError );
    Box.GetTextBrowser()->setHtml( i_rHtml );
    if( m_DialogRunner )
      m_DialogRunner( Box );
    else
      Box.exec();
    return Box.GetCheckBox() != nullptr && Box.GetCheckBox()->isChecked();
  }

  void VVersionCheckListener::ShowConnectionError()
  {
    const QString Support = QString::fromLatin1( SupportPage );
    ShowMessage( QStringLiteral( "Unable to contact version check server.<br/>"
                                 "Please check your network connection and try again.<br/>"
                                 "<a href=\"%1\">%1</a>" )
                     .arg( Support ),
                 EBox::Plain, true );
  }

  void VVersionCheckListener::Finish( int i_Status, const std::string& i_rBody, const std::string& i_rMessageType,
                                      const std::string& i_rError )
  {
    m_pSettings->Report( i_Status, i_rBody, i_rMessageType, i_rError );
    emit VersionCheckComplete( m_bStartupCheck );
    deleteLater();
  }
} // namespace VersionCheck
