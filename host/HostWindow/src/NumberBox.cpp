#include "NumberBox.h"

#include <HostServices/PreferenceRules.h>

#include <ZEK/TypedValueText.h>

#include <QtGui/QWheelEvent>
#include <QtWidgets/QLineEdit>

namespace HostWindow
{
namespace
{
constexpr int WidthInDigits = 14;
} // namespace

VNumberBox::VNumberBox( const VPreferenceItem& i_rItem, QWidget* i_pParent )
  : QAbstractSpinBox( i_pParent )
  , m_Item( i_rItem )
{
  setFixedWidth( fontMetrics().horizontalAdvance( QLatin1Char( '0' ) ) * WidthInDigits );
  setAccelerated( true );
  // Without this the wheel would give it the focus while the page is scrolled.
  setFocusPolicy( Qt::StrongFocus );
  connect( this, &QAbstractSpinBox::editingFinished, this, &VNumberBox::Finish );
}

VNumberBox::~VNumberBox()
{
  // A box that goes with the focus finishes its text once more.
  disconnect( this );
}

ZEK::VTypedValue VNumberBox::Typed() const
{
  QString Text = text().trimmed();
  bool bWhole = false;
  const qlonglong Number = Text.toLongLong( &bWhole );
  // "+030" is a number to people.
  Text = bWhole ? QString::number( Number ) : Text;
  ZEK::VTypedValue Value;
  (void)ZEK::IO::ValueFromText( m_Item.pSchema, Text.toStdString(), Value );
  return Value;
}

QString VNumberBox::TextOf( const ZEK::VTypedValue& i_rValue ) const
{
  std::string Text;
  (void)ZEK::IO::ValueToText( i_rValue, Text );
  return QString::fromStdString( Text );
}

void VNumberBox::Show( const ZEK::VTypedValue& i_rValue )
{
  m_Value = i_rValue;
  lineEdit()->setText( TextOf( i_rValue ) );
  update();
}

bool VNumberBox::Revert()
{
  const bool bUnfinished = text() != TextOf( m_Value );
  if ( bUnfinished )
  {
    Show( m_Value );
    selectAll();
  }
  return bUnfinished;
}

void VNumberBox::Finish()
{
  const ZEK::VTypedValue Value = Typed();
  if ( Value == m_Value )
  {
    Show( m_Value );
    return;
  }
  if ( Value.IsEmpty() )
  {
    const QString Text = text().trimmed();
    const QString Range = HostServices::RangeText( m_Item.Minimum, m_Item.Maximum, m_Item.Unit );
    emit Refused( Text.isEmpty()    ? tr( "A number is needed here." )
                  : Range.isEmpty() ? tr( "“%1” is not a number that this setting takes." ).arg( Text )
                                    : tr( "“%1” is not a number %2." ).arg( Text, Range ) );
    return;
  }
  emit Edited( Value );
}

void VNumberBox::stepBy( int i_Steps )
{
  // What is typed counts, as far as it is a number.
  ZEK::VTypedValue Value = Typed();
  if ( Value.IsEmpty() )
  {
    Value = m_Value;
  }
  HostServices::AddToNumber( Value, std::int64_t( i_Steps ) * m_Item.Step, m_Item.Minimum, m_Item.Maximum );
  lineEdit()->setText( TextOf( Value ) );
  selectAll();
  if ( !( Value == m_Value ) )
  {
    emit Edited( Value );
  }
}

QAbstractSpinBox::StepEnabled VNumberBox::stepEnabled() const
{
  int Order = 0;
  StepEnabled Enabled = isReadOnly() ? StepNone : StepUpEnabled | StepDownEnabled;
  Enabled.setFlag( StepUpEnabled,
                   Enabled.testFlag( StepUpEnabled ) &&
                       !( HostServices::CompareNumbers( m_Value, m_Item.Maximum, Order ) && Order >= 0 ) );
  Enabled.setFlag( StepDownEnabled,
                   Enabled.testFlag( StepDownEnabled ) &&
                       !( HostServices::CompareNumbers( m_Value, m_Item.Minimum, Order ) && Order <= 0 ) );
  return Enabled;
}

void VNumberBox::wheelEvent( QWheelEvent* io_pEvent )
{
  // A page that is scrolled changes nothing on its way.
  if ( hasFocus() )
  {
    QAbstractSpinBox::wheelEvent( io_pEvent );
  }
  else
  {
    io_pEvent->ignore();
  }
}

} // namespace HostWindow
