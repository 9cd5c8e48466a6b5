#pragma once

#include <QDialog>

namespace LumekVideoViewer
{
  // Product, version, branch and revision of this build. Developers also get buttons that crash
  // the process or report a failed assertion, to try the reporting paths.
  class VAboutDialog : public QDialog
  {
    Q_OBJECT

  public:
    VAboutDialog( bool i_bDeveloper, QWidget* i_pParent = nullptr );
  };
} // namespace LumekVideoViewer
