#include "tests/versioncheck/TestServer.h"

#include <QTcpSocket>

#include <memory>

VTestServer::VTestServer()
{
  m_Server.listen( QHostAddress::LocalHost, 0 );
  QObject::connect( &m_Server, &QTcpServer::newConnection, &m_Server,
                    [this]()
                    {
                      while( QTcpSocket* pSocket = m_Server.nextPendingConnection() )
                      {
                        QObject::connect( pSocket, &QTcpSocket::disconnected, pSocket, &QObject::deleteLater );
                        // Everything up to the blank line that ends the request's header; nothing
                        // is read after it.
                        auto pHeader = std::make_shared< QByteArray >();
                        QObject::connect( pSocket, &QTcpSocket::readyRead, pSocket,
                                          [this, pSocket, pHeader]()
                                          {
                                            if( pHeader->endsWith( "\r\n\r\n" ) )
                                              return;
                                            pHeader->append( pSocket->readAll() );
                                            if( !pHeader->contains( "\r\n\r\n" ) )
                                              return;
                                            pHeader->truncate( pHeader->indexOf( "\r\n\r\n" ) + 4 );
                                            Answer( *pSocket, *pHeader );
                                          } );
                      }
                    } );
}

quint16 VTestServer::ClosedPort()
{
  QTcpServer Probe;
  Probe.listen( QHostAddress::LocalHost, 0 );
  const quint16 Port = Probe.serverPort();
  Probe.close();
  return Port;
}

void VTestServer::Answer( QTcpSocket& io_rSocket, const QByteArray& i_rHeader )
{
  m_Requests << QString::fromLatin1( i_rHeader.left( i_rHeader.indexOf( "\r\n" ) ).split( ' ' ).value( 1 ) );
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
