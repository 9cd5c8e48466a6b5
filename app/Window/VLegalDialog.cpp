#include "app/Window/VLegalDialog.h"

#include <QFile>
#include <QQmlContext>
#include <QQmlEngine>
#include <QQuickItem>
#include <QQuickWidget>
#include <QVBoxLayout>
#include <QVariantList>
#include <QVariantMap>

// Resources of a static library are linked in only when their initialiser is named, outside any
// namespace.
static void InitialiseLegalResource()
{
  Q_INIT_RESOURCE( Legal );
}

namespace LumekVideoViewer
{
  VQuickWidgetServices::VQuickWidgetServices( const QString& i_rApplicationDirectory )
      : m_ApplicationDirectory( i_rApplicationDirectory )
  {
  }

  QQuickWidget* VQuickWidgetServices::CreateQuickWidget( QWidget* i_pParent ) const
  {
    QQuickWidget* pWidget = new QQuickWidget( i_pParent );
    pWidget->engine()->addImportPath( m_ApplicationDirectory + "/qml" );
    pWidget->setResizeMode( QQuickWidget::SizeRootObjectToView );
    return pWidget;
  }

  const std::vector< VLegalComponent >& LegalComponents()
  {
    static const std::vector< VLegalComponent > s_Components = {
        { "Qt 5", "GNU Lesser General Public License v3.0",
          "Copyright (C) 2020 The Qt Company Ltd. and other contributors.",
          ":/com.Lumek.LumekVideoViewer.Licenses/Qt5.txt" },
        { "Boost", "Boost Software License 1.0", "Copyright Beman Dawes, David Abrahams, 1998-2005.",
          ":/com.Lumek.LumekVideoViewer.Licenses/Boost.txt" },
        { "libebml", "GNU Lesser General Public License v2.1",
          "Copyright (C) 2002-2005 Steve Lhomme <steve.lhomme@free.fr>",
          ":/com.Lumek.LumekVideoViewer.Licenses/libebml.txt" },
        { "libmatroska", "GNU Lesser General Public License v2.1",
          "Copyright (C) 2002-2005 Steve Lhomme <steve.lhomme@free.fr>",
          ":/com.Lumek.LumekVideoViewer.Licenses/libmatroska.txt" },
        { "libjpeg-turbo", "IJG License, BSD 3-Clause License and zlib License",
          "Copyright (C) 2009-2023 D. R. Commander. All Rights Reserved.",
          ":/com.Lumek.LumekVideoViewer.Licenses/libjpeg-turbo.txt" },
        { "OpenH264", "BSD 2-Clause License", "Copyright (c) 2013, Cisco Systems",
          ":/com.Lumek.LumekVideoViewer.Licenses/OpenH264.txt" },
        { "ImageMagick", "ImageMagick License (Apache 2.0 with a preamble)", "Copyright 1999 ImageMagick Studio LLC",
          ":/com.Lumek.LumekVideoViewer.Licenses/ImageMagick.txt" },
        { "RapidXml", "Boost Software License 1.0 or MIT License", "Copyright (c) 2006, 2007 Marcin Kalicinski",
          ":/com.Lumek.LumekVideoViewer.Licenses/RapidXml.txt" },
    };
    return s_Components;
  }

  QString LicenceText( const VLegalComponent& i_rComponent )
  {
    static const bool s_bResource = ( InitialiseLegalResource(), true );
    (void)s_bResource;
    QFile File( i_rComponent.LicenceResource );
    if( !File.open( QIODevice::ReadOnly | QIODevice::Text ) )
      return QString();
    return QString::fromUtf8( File.readAll() );
  }

  VLegalDialog::VLegalDialog( const std::shared_ptr< VQuickWidgetServices >& i_pServices, QWidget* i_pParent )
      : QDialog( i_pParent )
  {
    setWindowFlags( windowFlags() & ~Qt::WindowContextHelpButtonHint );
    setWindowTitle( "Third-Party Licenses" );
    resize( 900, 620 );

    QVariantList Components;
    for( const VLegalComponent& rComponent : LegalComponents() )
      Components.append( QVariantMap{ { "name", rComponent.Name },
                                      { "licence", rComponent.Licence },
                                      { "copyright", rComponent.Copyright },
                                      { "text", LicenceText( rComponent ) } } );

    InitialiseLegalResource();
    const VQuickWidgetServices Fallback( QCoreApplication::applicationDirPath() );
    m_pQuickWidget = ( i_pServices ? *i_pServices : Fallback ).CreateQuickWidget( this );
    // The model goes in before the page loads, so its bindings see it at once.
    m_pQuickWidget->rootContext()->setContextProperty( "legalComponents", Components );
    m_pQuickWidget->setSource( QUrl( "qrc:/com.Lumek.LumekVideoViewer.Legal/Licenses.qml" ) );

    QVBoxLayout* pLayout = new QVBoxLayout( this );
    pLayout->setContentsMargins( 0, 0, 0, 0 );
    pLayout->addWidget( m_pQuickWidget );
    // The page's own "Close" button ends the dialog.
    if( QQuickItem* pRoot = m_pQuickWidget->rootObject() )
      connect( pRoot, SIGNAL( closeRequested() ), this, SLOT( accept() ) );
  }
} // namespace LumekVideoViewer
