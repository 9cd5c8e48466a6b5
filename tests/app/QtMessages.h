#pragma once

// What Qt says while the object lives, warnings and worse: a sheet rule it cannot read, a painter
// on an empty range.

#include <QString>
#include <QStringList>
#include <QtGlobal>

#include <string>

namespace AppTest
{
  class VQtMessages
  {
  public:
    VQtMessages() : m_Previous( qInstallMessageHandler( &Collect ) ) { s_Messages.clear(); }
    ~VQtMessages() { qInstallMessageHandler( m_Previous ); }
    std::string Text() const { return s_Messages.join( "\n" ).toStdString(); }

  private:
    static void Collect( QtMsgType i_Type, const QMessageLogContext&, const QString& i_rMessage )
    {
      if( i_Type != QtDebugMsg && i_Type != QtInfoMsg )
        s_Messages << i_rMessage;
    }
    static inline QStringList s_Messages;
    QtMessageHandler m_Previous;
  };
} // namespace AppTest
