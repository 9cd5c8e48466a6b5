#pragma once

#include "versioncheck/VersionCheck/IVersionCheckSettings.h"

#include <QObject>
#include <QPointer>
#include <QString>
#include <QWidget>

#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace VersionCheck
{
  class VVersionCheckMessageBox;

  // Runs a filled message box. The application's runs it modally with exec(); tests put in their
  // own to look at the box and close it.
  using VDialogRunner = std::function< void( VVersionCheckMessageBox& ) >;

  // Lives for one request: reads the server's reply, updates the stored message id, decides what
  // to show, reports the outcome and deletes itself later.
  class VVersionCheckListener : public QObject
  {
    Q_OBJECT

  public:
    VVersionCheckListener( const QString& i_rName, bool i_bStartupCheck,
                           std::shared_ptr< IVersionCheckSettings > i_pSettings, QWidget* i_pDialogParent,
                           VDialogRunner i_DialogRunner, QObject* i_pParent );

  signals:
    void VersionUpdated( std::string i_Version );
    void WhitelistUpdated( std::vector< std::string > i_Whitelist );
    void VersionCheckComplete( bool i_bStartupCheck );

  public slots:
    // Connected to the reply's finished(); the reply is taken from sender().
    void OnReplyFinished();
    void OnTimeout();

  private:
    enum class EBox
    {
      Plain,
      WithCheckBox
    };

    void HandleReply( const std::string& i_rBody, int i_Status, const std::string& i_rErrorText );
    // Shows the message box; returns whether its check box was ticked.
    bool ShowMessage( const QString& i_rHtml, EBox i_Box, bool i_bError );
    void ShowConnectionError();
    void Finish( int i_Status, const std::string& i_rBody, const std::string& i_rMessageType,
                 const std::string& i_rError );

    QString m_Name;
    bool m_bStartupCheck;
    std::shared_ptr< IVersionCheckSettings > m_pSettings;
    QPointer< QWidget > m_pDialogParent;
    VDialogRunner m_DialogRunner;
    bool m_bFinished = false;
  };
} // namespace VersionCheck
