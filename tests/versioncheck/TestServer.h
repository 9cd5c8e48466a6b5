#pragma once

#include <QByteArray>
#include <QStringList>
#include <QTcpServer>
#include <QTcpSocket>

#include <string>

// A version server for the tests: plain HTTP on 127.0.0.1 at a port of its own choice, one reply
// per connection.
class VTestServer
{
public:
  enum class EMode
  {
    Answer, // the set status and body, then close
    Silent, // read the request and never answer
    Flood,  // announce and send a body larger than any reply the check accepts
    Stream  // send such a body without announcing its length, ending it by closing
  };

  VTestServer()
  {
    m_Server.listen( QHostAddress::LocalHost, 0 );
    QObject::connect( &m_Server, &QTcpServer::newConnection, &m_Server,
                      [this]
                      {
                        while( QTcpSocket* pSocket = m_Server.nextPendingConnection() )
                        {
                          QObject::connect( pSocket, &QTcpSocket::disconnected, pSocket, &QObject::deleteLater );
                          QObject::connect( pSocket, &QTcpSocket::readyRead, pSocket, [=] { Answer( *pSocket ); } );
                        }
                      } );
  }

  void Serve( const std::string& i_rBody, int i_Status = 200 )
  {
    m_Status = i_Status, m_Body = QByteArray::fromStdString( i_rBody );
  }
  void SetMode( EMode i_Mode ) { m_Mode = i_Mode; }

  // "http://127.0.0.1:<port>/"
  QString Url() const { return QStringLiteral( "http://127.0.0.1:%1/" ).arg( m_Server.serverPort() ); }
  // The request targets received so far, e.g. "/?protocol=1.0&name=...".
  const QStringList& Requests() const { return m_Requests; }

  // The address of a port on 127.0.0.1 where nothing listens.
  static std::string ClosedUrl() { return VTestServer().Url().toStdString(); }

private:
  void Answer( QTcpSocket& io_rSocket )
  {
    // Nothing before the blank line that ends the request's header; a GET sends nothing after it.
    if( !io_rSocket.peek( 1 << 16 ).contains( "\r\n\r\n" ) )
      return;
    const QByteArray Request = io_rSocket.readAll();
    m_Requests << QString::fromLatin1( Request.left( Request.indexOf( "\r\n" ) ).split( ' ' ).value( 1 ) );
    if( m_Mode == EMode::Silent )
      return;
    const bool bLarge = m_Mode == EMode::Flood || m_Mode == EMode::Stream;
    const QByteArray Body = bLarge ? QByteArray( 2 * 1024 * 1024, 'x' ) : m_Body;
    QByteArray Header = QStringLiteral( "HTTP/1.1 %1 %2\r\nContent-Type: text/html\r\nConnection: close\r\n" )
                            .arg( m_Status )
                            .arg( m_Status == 200 ? "OK" : "Not Found" )
                            .toLatin1();
    if( m_Mode != EMode::Stream )
      Header += "Content-Length: " + QByteArray::number( Body.size() ) + "\r\n";
    io_rSocket.write( Header + "\r\n" + Body );
    io_rSocket.disconnectFromHost();
  }

  QTcpServer m_Server;
  EMode m_Mode = EMode::Answer;
  int m_Status = 200;
  QByteArray m_Body;
  QStringList m_Requests;
};
