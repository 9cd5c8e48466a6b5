#include "app/Window/VPropertiesDialog.h"

#include "app/VideoSource/VideoSourceTexts.h"

#include <QHBoxLayout>
#include <QHeaderView>
#include <QPushButton>
#include <QTableWidget>
#include <QVBoxLayout>

namespace LumekVideoViewer
{
  namespace
  {
    QTableWidgetItem* ReadOnlyItem( const std::string& i_rText )
    {
      QTableWidgetItem* pItem = new QTableWidgetItem( QString::fromStdString( i_rText ) );
      pItem->setFlags( pItem->flags() & ~Qt::ItemIsEditable );
      return pItem;
    }
  } // namespace

  VPropertiesDialog::VPropertiesDialog( QWidget* i_pParent )
      : QDialog( i_pParent ), m_pTable( new QTableWidget( this ) )
  {
    setWindowFlags( windowFlags() & ~Qt::WindowContextHelpButtonHint );
    setWindowTitle( "Video Properties" );
    resize( 400, 600 );

    QPushButton* pClose = new QPushButton( "Close", this );
    pClose->setFixedWidth( 100 );
    connect( pClose, &QPushButton::clicked, this, &QDialog::hide );

    QHBoxLayout* pButtons = new QHBoxLayout;
    pButtons->addWidget( new QWidget( this ) );
    pButtons->addWidget( pClose );

    QVBoxLayout* pLayout = new QVBoxLayout( this );
    pLayout->addWidget( m_pTable );
    pLayout->addLayout( pButtons );

    ResetTable();
  }

  void VPropertiesDialog::ResetTable()
  {
    m_pTable->clearContents();
    m_pTable->setColumnCount( 2 );
    m_pTable->setRowCount( 0 );
    m_pTable->setHorizontalHeaderLabels( { "Property", "Value" } );
    m_pTable->horizontalHeader()->setSectionResizeMode( QHeaderView::Stretch );
  }

  void VPropertiesDialog::SetVideoSource( const VVideoSource& i_rSource )
  {
    const VPropertyRows Rows = ComposePropertyRows( i_rSource );
    ResetTable();
    m_pTable->setRowCount( static_cast< int >( Rows.size() ) );
    for( int Row = 0; Row < static_cast< int >( Rows.size() ); ++Row )
    {
      m_pTable->setItem( Row, 0, ReadOnlyItem( Rows[Row].first ) );
      m_pTable->setItem( Row, 1, ReadOnlyItem( Rows[Row].second ) );
    }
  }

  void VPropertiesDialog::Clear()
  {
    ResetTable();
  }
} // namespace LumekVideoViewer
