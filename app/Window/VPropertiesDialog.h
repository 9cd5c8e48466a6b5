#pragma once

#include <QDialog>

class QTableWidget;

namespace LumekVideoViewer
{
  class VVideoSource;

  // Every attribute of the open file as key and value. It shows the file as a whole and is filled
  // once per open, never per frame.
  class VPropertiesDialog : public QDialog
  {
    Q_OBJECT

  public:
    explicit VPropertiesDialog( QWidget* i_pParent = nullptr );

    void SetVideoSource( const VVideoSource& i_rSource );
    void Clear();

    QTableWidget* GetTable() const { return m_pTable; }

  private:
    void ResetTable();

    QTableWidget* m_pTable;
  };
} // namespace LumekVideoViewer
