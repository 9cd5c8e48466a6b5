#pragma once

#include <QDialog>

class QCheckBox;
class QTextBrowser;
class QUrl;

namespace VersionCheck
{
  // Shows a version server's HTML message: an icon, the text, "OK", and on request the box
  // "Do not show this message again.". Its creator fills the browser with setHtml and runs it
  // modally with exec(). Links open in the system's browser; the dialog stays.
  class VVersionCheckMessageBox : public QDialog
  {
    Q_OBJECT

  public:
    // i_rName goes into the title "Checking <name> Version"; i_bError picks the critical icon
    // instead of the information icon.
    VVersionCheckMessageBox( bool i_bCheckBox, const QString& i_rName, QWidget* i_pParent, bool i_bError );

    QTextBrowser* GetTextBrowser() const { return m_pTextBrowser; }
    // Null when the dialog was made without the box.
    QCheckBox* GetCheckBox() const { return m_pCheckBox; }
    bool IsError() const { return m_bError; }

  private slots:
    void handleAnchorClicked( const QUrl& i_rUrl );

  private:
    QCheckBox* m_pCheckBox = nullptr;
    QTextBrowser* m_pTextBrowser = nullptr;
    bool m_bError;
  };
} // namespace VersionCheck
