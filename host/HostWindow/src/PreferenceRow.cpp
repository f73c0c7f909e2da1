#include "PreferenceRow.h"

#include "Icons.h"

#include <HostServices/PreferenceRules.h>

#include <ZEK/Serialiser.h>

#include <QtCore/QFileInfo>
#include <QtGui/QKeyEvent>
#include <QtWidgets/QApplication>
#include <QtWidgets/QLineEdit>

namespace HostWindow
{
namespace
{
constexpr int LabelColumn = 0;
constexpr int FieldColumn = 1;
constexpr int ResetColumn = 2;

QColor NoteColour( const QPalette& i_rPalette, bool i_bRefusal )
{
  const bool bDark = i_rPalette.color( QPalette::Window ).lightness() < 128;
  if ( !i_bRefusal )
  {
    return i_rPalette.color( QPalette::PlaceholderText );
  }
  return bDark ? QColor( 0xff, 0xb0, 0xa4 ) : QColor( 0xa1, 0x28, 0x1c );
}
} // namespace

VPreferenceRow::VPreferenceRow( const VPreferenceItem& i_rItem, const QString& i_rText,
                                HostServices::VPreferenceEditor& io_rEditor, QGridLayout& io_rGrid, QWidget* i_pPage )
  : QObject( i_pPage )
  , m_Item( i_rItem )
  , m_rEditor( io_rEditor )
  , m_pField( MakePreferenceField( i_rItem, i_pPage ) )
{
  const int Line = io_rGrid.rowCount();
  m_pField->setObjectName( QString::fromStdString( io_rEditor.Store()->EntryPath( i_rItem.pEntry ).Text() ) );
  m_pField->setToolTip( i_rItem.ToolTip );
  m_pField->focusProxy()->setAccessibleName( i_rItem.Text );
  m_pField->focusProxy()->setAccessibleDescription( i_rItem.ToolTip );
  m_pField->focusProxy()->installEventFilter( this );
  if ( m_pField->HasText() )
  {
    m_pField->SetText( i_rText );
    io_rGrid.addWidget( m_pField, Line, LabelColumn, 1, 2 );
  }
  else
  {
    m_pLabel = new QLabel( i_rText, i_pPage );
    m_pLabel->setTextFormat( Qt::PlainText );
    m_pLabel->setBuddy( m_pField );
    m_pLabel->setToolTip( i_rItem.ToolTip );
    m_pLabel->setWordWrap( true );
    io_rGrid.addWidget( m_pLabel, Line, LabelColumn );
    io_rGrid.addWidget( m_pField, Line, FieldColumn );
  }
  m_pReset = new QToolButton( i_pPage );
  m_pReset->setAutoRaise( true );
  m_pReset->setIcon( MakeIcon( EIcon::Reset, i_pPage->palette().color( QPalette::ButtonText ) ) );
  const QString Default = i_rItem.DefaultText.isEmpty() ? tr( "the default" ) : i_rItem.DefaultText;
  m_pReset->setToolTip( tr( "Back to %1" ).arg( Default ) );
  m_pReset->setAccessibleName( tr( "%1: back to %2" ).arg( i_rItem.Text, Default ) );
  m_pReset->setObjectName( m_pField->objectName() + "/Reset" );
  // The column keeps its width, so that nothing moves when the button comes and goes.
  QSizePolicy Policy = m_pReset->sizePolicy();
  Policy.setRetainSizeWhenHidden( true );
  m_pReset->setSizePolicy( Policy );
  io_rGrid.addWidget( m_pReset, Line, ResetColumn );
  m_pNote = new QLabel( i_pPage );
  m_pNote->setObjectName( m_pField->objectName() + "/Note" );
  m_pNote->setWordWrap( true );
  m_pNote->setTextFormat( Qt::PlainText );
  m_pNote->setTextInteractionFlags( Qt::TextSelectableByMouse );
  m_pNote->hide();
  io_rGrid.addWidget( m_pNote, Line + 1, m_pLabel ? FieldColumn : LabelColumn, 1, m_pLabel ? 1 : 2 );

  connect( m_pField, &VPreferenceField::Edited, this, &VPreferenceRow::Edit );
  connect( m_pField, &VPreferenceField::Refused, this, &VPreferenceRow::Refuse );
  connect( m_pReset, &QToolButton::clicked, this, &VPreferenceRow::Reset );
}

void VPreferenceRow::Refresh( const ZEK::IStoreReader& i_rReader )
{
  const ZEK::VTypedValue& rValue = HostServices::EditedValue( i_rReader, m_Item.pEntry );
  if ( rValue == m_Value )
  {
    return;
  }
  ShowValue( rValue );
  // Somebody else may have set what this window would refuse.
  const bool bAsk = m_Item.Choices.empty() && !m_Item.bReadOnly;
  const QString Why = bAsk ? HostServices::WhyRefused( i_rReader, m_Item.pEntry, rValue ) : QString();
  if ( !Why.isEmpty() )
  {
    ShowNote( Why, true );
  }
}

void VPreferenceRow::ShowValue( const ZEK::VTypedValue& i_rValue )
{
  m_Value = i_rValue;
  m_pField->Show( i_rValue );
  ShowNote( {}, false );
  if ( m_Item.bFolder )
  {
    std::string Path;
    const bool bGone =
        ZEK::IO::ReadTyped( i_rValue, Path ) && !Path.empty() && !QFileInfo::exists( QString::fromStdString( Path ) );
    ShowNote( bGone ? tr( "This folder is not there now." ) : QString(), false );
  }
  const bool bChanged = !m_Item.bReadOnly && !m_Item.Default.IsEmpty() && !( i_rValue == m_Item.Default );
  if ( !bChanged && m_pReset->hasFocus() )
  {
    TakeFocus();
  }
  m_pReset->setVisible( bChanged && m_bVisible );
}

void VPreferenceRow::SetVisible( bool i_bVisible )
{
  m_bVisible = i_bVisible;
  m_pField->setVisible( i_bVisible );
  if ( m_pLabel )
  {
    m_pLabel->setVisible( i_bVisible );
  }
  // A row that is left out leaves no height behind.
  QSizePolicy Policy = m_pReset->sizePolicy();
  Policy.setRetainSizeWhenHidden( i_bVisible );
  m_pReset->setSizePolicy( Policy );
  m_pReset->setVisible( i_bVisible && !m_Item.bReadOnly && !m_Item.Default.IsEmpty() &&
                        !( m_Value == m_Item.Default ) );
  m_pNote->setVisible( i_bVisible && !m_pNote->text().isEmpty() );
}

bool VPreferenceRow::HasFocus() const
{
  return m_pField->isAncestorOf( QApplication::focusWidget() ) || m_pReset->hasFocus();
}

void VPreferenceRow::TakeFocus()
{
  m_pField->setFocus( Qt::OtherFocusReason );
}

void VPreferenceRow::Edit( const ZEK::VTypedValue& i_rValue )
{
  QString Why;
  const bool bNumber = HostServices::IsNumber( m_Item.pSchema ) && m_Item.Choices.empty();
  const QString MergeKey = bNumber ? QString( "%1#%2" ).arg( m_pField->objectName() ).arg( m_Visit ) : QString();
  if ( m_rEditor.Set( m_Item.pEntry, i_rValue, Why, MergeKey ).IsError() )
  {
    Refuse( Why );
    return;
  }
  // The store's own word comes later and then says nothing new.
  ShowValue( i_rValue );
  emit Changed();
}

void VPreferenceRow::Reset()
{
  QString Why;
  if ( m_rEditor.Reset( m_Item.pEntry, Why ).IsError() )
  {
    Refuse( Why );
    return;
  }
  ShowValue( m_Item.Default );
  emit Changed();
}

void VPreferenceRow::Refuse( const QString& i_rWhy )
{
  ShowValue( m_Value );
  ShowNote( i_rWhy, true );
}

void VPreferenceRow::ShowNote( const QString& i_rText, bool i_bRefusal )
{
  QPalette Palette = m_pField->palette();
  Palette.setColor( QPalette::WindowText, NoteColour( Palette, i_bRefusal ) );
  m_pNote->setPalette( Palette );
  m_pNote->setText( i_rText );
  m_pNote->setVisible( m_bVisible && !i_rText.isEmpty() );
}

bool VPreferenceRow::eventFilter( QObject* io_pObject, QEvent* io_pEvent )
{
  if ( io_pEvent->type() == QEvent::FocusIn )
  {
    ++m_Visit;
  }
  if ( io_pEvent->type() == QEvent::ShortcutOverride )
  {
    // A field takes these keys for its text even when it has nothing to take back; then they are the window's.
    const auto* const pKey = static_cast< QKeyEvent* >( io_pEvent );
    auto* const pField = static_cast< QWidget* >( io_pObject );
    const auto* pLine = qobject_cast< QLineEdit* >( pField );
    pLine = pLine ? pLine : pField->findChild< QLineEdit* >();
    if ( pLine && ( ( pKey->matches( QKeySequence::Undo ) && !pLine->isUndoAvailable() ) ||
                    ( pKey->matches( QKeySequence::Redo ) && !pLine->isRedoAvailable() ) ) )
    {
      io_pEvent->ignore();
      return true;
    }
  }
  return QObject::eventFilter( io_pObject, io_pEvent );
}

} // namespace HostWindow
