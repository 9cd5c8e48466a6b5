#pragma once

#include <QDialog>
#include <QString>

#include <memory>
#include <vector>

class QQuickWidget;

namespace LumekVideoViewer
{
  // Hosts QML pages in widgets: the application's folder is where extra QML modules are looked for
  // besides the resources.
  class VQuickWidgetServices
  {
  public:
    explicit VQuickWidgetServices( const QString& i_rApplicationDirectory );
    // A widget ready for a page: the caller sets its context properties, then its source.
    QQuickWidget* CreateQuickWidget( QWidget* i_pParent ) const;

  private:
    QString m_ApplicationDirectory;
  };

  // One open-source component the program is built from.
  struct VLegalComponent
  {
    QString Name;
    QString Licence;
    QString Copyright;
    // A text resource with the licence as the component ships it.
    QString LicenceResource;
  };

  // Every component, in the order the dialog lists them.
  const std::vector< VLegalComponent >& LegalComponents();
  // The text of a component's licence; empty when the resource is missing.
  QString LicenceText( const VLegalComponent& i_rComponent );

  // "Third-Party Licenses": a themed QML page listing each component with its licence text.
  class VLegalDialog : public QDialog
  {
    Q_OBJECT

  public:
    VLegalDialog( const std::shared_ptr< VQuickWidgetServices >& i_pServices, QWidget* i_pParent = nullptr );
    QQuickWidget* GetQuickWidget() const { return m_pQuickWidget; }

  private:
    QQuickWidget* m_pQuickWidget;
  };
} // namespace LumekVideoViewer
