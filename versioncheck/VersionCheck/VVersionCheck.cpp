#include "versioncheck/VersionCheck/VVersionCheck.h"

#include <boost/format.hpp>

#include <QCoreApplication>
#include <QNetworkAccessManager>
#include <QNetworkReply>
#include <QNetworkRequest>
#include <QThread>
#include <QTimer>
#include <QUrl>

#include <algorithm>
#include <climits>

namespace VersionCheck
{
  VVersionCheck::VVersionCheck( QWidget* i_pParent, const std::string& i_rServer )
      : m_Server( i_rServer ), m_pParent( i_pParent ), m_pNetwork( new QNetworkAccessManager( this ) )
  {
  }

  VVersionCheck::~VVersionCheck() = default;

  void VVersionCheck::SetServer( const std::string& i_rServer )
  {
    m_Server = i_rServer;
  }

  void VVersionCheck::SetDialogRunner( VDialogRunner i_Runner )
  {
    m_DialogRunner = std::move( i_Runner );
  }

  std::string VVersionCheck::RequestUrl( const std::string& i_rName, const std::string& i_rVersion,
                                         const std::string& i_rSystem, const std::string& i_rProtocol ) const
  {
    return ( boost::format( "%s?protocol=%s&name=%s&version=%s&system=%s" ) % m_Server % i_rProtocol % i_rName %
             i_rVersion % i_rSystem )
        .str();
  }

  bool VVersionCheck::Check( const std::string& i_rName, const std::string& i_rVersion, const std::string& i_rSystem,
                             bool i_bStartupCheck, std::shared_ptr< IVersionCheckSettings > i_pSettings,
                             unsigned i_TimeoutSeconds, const std::string& i_rProtocol )
  {
    const QCoreApplication* pApplication = QCoreApplication::instance();
    if( pApplication == nullptr || QThread::currentThread() != pApplication->thread() || !i_pSettings )
      return false;

    const QUrl Url( QString::fromStdString( RequestUrl( i_rName, i_rVersion, i_rSystem, i_rProtocol ) ),
                    QUrl::TolerantMode );
    QNetworkReply* pReply = m_pNetwork->get( QNetworkRequest( Url ) );
    if( pReply == nullptr )
      return false;
    // The reply is held in memory whole, so one that announces or delivers more than we accept is
    // cut off. Qt pauses the transfer short of a full read buffer, by as much as one network chunk:
    // the buffer is twice the limit so that the limit is always passed before the pause.
    pReply->setReadBufferSize( 2 * MaximumReplyBytes );
    const auto CutOffWhenTooLarge = [pReply]()
    {
      if( pReply->bytesAvailable() > MaximumReplyBytes ||
          pReply->header( QNetworkRequest::ContentLengthHeader ).toLongLong() > MaximumReplyBytes )
        pReply->abort();
    };
    connect( pReply, &QNetworkReply::metaDataChanged, pReply, CutOffWhenTooLarge );
    connect( pReply, &QNetworkReply::readyRead, pReply, CutOffWhenTooLarge );

    auto* pListener = new VVersionCheckListener( QString::fromStdString( i_rName ), i_bStartupCheck,
                                                 std::move( i_pSettings ), m_pParent, m_DialogRunner, this );
    connect( pListener, &VVersionCheckListener::VersionUpdated, this, &VVersionCheck::RelayVersionUpdated );
    connect( pListener, &VVersionCheckListener::WhitelistUpdated, this, &VVersionCheck::RelayWhitelistUpdated );
    connect( pListener, &VVersionCheckListener::VersionCheckComplete, this, &VVersionCheck::RelayVersionCheckComplete );
    connect( pReply, &QNetworkReply::finished, pListener, &VVersionCheckListener::OnReplyFinished );
    const auto Milliseconds = std::min< unsigned long long >( i_TimeoutSeconds * 1000ull, INT_MAX );
    QTimer::singleShot( static_cast< int >( Milliseconds ), pListener, &VVersionCheckListener::OnTimeout );
    return true;
  }

  void VVersionCheck::RelayVersionUpdated( std::string i_Version )
  {
    VersionUpdatedCallback( i_Version );
  }

  void VVersionCheck::RelayWhitelistUpdated( std::vector< std::string > i_Whitelist )
  {
    WhitelistUpdatedCallback( i_Whitelist );
  }

  void VVersionCheck::RelayVersionCheckComplete( bool i_bStartupCheck )
  {
    VersionCheckCompleteCallback( i_bStartupCheck );
  }
} // namespace VersionCheck
