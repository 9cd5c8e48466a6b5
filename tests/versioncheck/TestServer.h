#pragma once

#include <QByteArray>
#include <QString>
#include <QStringList>
#include <QTcpServer>

class QTcpSocket;

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

  VTestServer();

  void SetReply( int i_Status, const QByteArray& i_rBody ) { m_Status = i_Status, m_Body = i_rBody; }
  void SetMode( EMode i_Mode ) { m_Mode = i_Mode; }

  // "http://127.0.0.1:<port>/"
  QString Url() const { return QStringLiteral( "http://127.0.0.1:%1/" ).arg( m_Server.serverPort() ); }
  // The request targets received so far, e.g. "/?protocol=1.0&name=...".
  const QStringList& Requests() const { return m_Requests; }

  // A port on 127.0.0.1 where nothing listens.
  static quint16 ClosedPort();

private:
  void Answer( QTcpSocket& io_rSocket, const QByteArray& i_rHeader );

  QTcpServer m_Server;
  EMode m_Mode = EMode::Answer;
  int m_Status = 200;
  QByteArray m_Body;
  QStringList m_Requests;
};
