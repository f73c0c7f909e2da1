#pragma once

#include "PreferenceFields.h"

#include <HostServices/VPreferenceEditor.h>

#include <QtCore/QPointer>
#include <QtWidgets/QGridLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QToolButton>

namespace HostWindow
{

/// One preference in a page of them: its text, its field, what takes it back to the default, and a note below.
class VPreferenceRow final : public QObject
{
  Q_OBJECT

public:
  /// Takes the next two lines of the grid. `i_rText` may hold the sign of a mnemonic. The page owns the row.
  VPreferenceRow( const VPreferenceItem& i_rItem, const QString& i_rText, HostServices::VPreferenceEditor& io_rEditor,
                  QGridLayout& io_rGrid, QWidget* i_pPage );

  const VPreferenceItem& Item() const { return m_Item; }
  /// Shows the value of now; a value that is shown already leaves unfinished text alone.
  void Refresh( const ZEK::IStoreReader& i_rReader );
  void SetVisible( bool i_bVisible );
  bool Revert() { return m_pField->Revert(); }
  bool HasFocus() const;
  void TakeFocus();

signals:
  /// The operator changed something.
  void Changed();

protected:
  bool eventFilter( QObject* io_pObject, QEvent* io_pEvent ) override;

private:
  void Edit( const ZEK::VTypedValue& i_rValue );
  void Reset();
  /// What is shown is what is there; the note says why not what was asked for.
  void Refuse( const QString& i_rWhy );
  void ShowNote( const QString& i_rText, bool i_bRefusal );
  void ShowValue( const ZEK::VTypedValue& i_rValue );

  VPreferenceItem m_Item;
  HostServices::VPreferenceEditor& m_rEditor;
  ZEK::VTypedValue m_Value;
  int m_Visit = 0; ///< how often the field got the focus: edits of one visit are one step
  bool m_bVisible = true;
  QLabel* m_pLabel = nullptr;
  VPreferenceField* m_pField = nullptr;
  QToolButton* m_pReset = nullptr;
  QLabel* m_pNote = nullptr;
};

} // namespace HostWindow
