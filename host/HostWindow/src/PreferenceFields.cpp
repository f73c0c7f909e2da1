#include "PreferenceFields.h"

#include "NumberBox.h"

#include <HostServices/PreferenceRules.h>

#include <ZEK/Serialiser.h>
#include <ZEK/TypedValueText.h>

#include <QtCore/QDir>
#include <QtGui/QWheelEvent>
#include <QtWidgets/QCheckBox>
#include <QtWidgets/QComboBox>
#include <QtWidgets/QFileDialog>
#include <QtWidgets/QHBoxLayout>
#include <QtWidgets/QLabel>
#include <QtWidgets/QLineEdit>
#include <QtWidgets/QPushButton>

namespace HostWindow
{
namespace
{
using ZEK::VTypedValue;
using ZEK::IO::EType;

QHBoxLayout* MakeLayout( QWidget* i_pField )
{
  auto* const pLayout = new QHBoxLayout( i_pField );
  pLayout->setContentsMargins( 0, 0, 0, 0 );
  return pLayout;
}

class VSwitchField final : public VPreferenceField
{
public:
  VSwitchField( const VPreferenceItem& i_rItem, QWidget* i_pParent )
    : VPreferenceField( i_pParent )
    , m_pBox( new QCheckBox( this ) )
  {
    MakeLayout( this )->addWidget( m_pBox );
    layout()->setAlignment( m_pBox, Qt::AlignLeft );
    setFocusProxy( m_pBox );
    m_pBox->setEnabled( !i_rItem.bReadOnly );
    connect( m_pBox, &QCheckBox::clicked, this,
             [this]( bool i_bOn )
             {
               emit Edited( ZEK::IO::MakeValue( i_bOn ) );
             } );
  }
  void Show( const VTypedValue& i_rValue ) override
  {
    bool bOn = false;
    (void)ZEK::IO::ReadTyped( i_rValue, bOn );
    m_pBox->setChecked( bOn );
  }
  bool HasText() const override { return true; }
  void SetText( const QString& i_rText ) override { m_pBox->setText( i_rText ); }

private:
  QCheckBox* m_pBox;
};

class VCalmComboBox final : public QComboBox
{
public:
  using QComboBox::QComboBox;

protected:
  // A page that is scrolled changes nothing on its way.
  void wheelEvent( QWheelEvent* io_pEvent ) override
  {
    if ( hasFocus() )
    {
      QComboBox::wheelEvent( io_pEvent );
    }
    else
    {
      io_pEvent->ignore();
    }
  }
};

class VChoiceField final : public VPreferenceField
{
public:
  VChoiceField( std::vector< VPreferenceItem::VChoice > i_Choices, const VPreferenceItem& i_rItem, QWidget* i_pParent )
    : VPreferenceField( i_pParent )
    , m_Choices( std::move( i_Choices ) )
    , m_Unit( i_rItem.Unit )
    , m_pBox( new VCalmComboBox( this ) )
  {
    auto* const pLayout = MakeLayout( this );
    pLayout->addWidget( m_pBox );
    pLayout->addStretch( 1 );
    setFocusProxy( m_pBox );
    m_pBox->setFocusPolicy( Qt::StrongFocus );
    m_pBox->setEnabled( !i_rItem.bReadOnly );
    for ( const VPreferenceItem::VChoice& rChoice : m_Choices )
    {
      m_pBox->addItem( rChoice.Text );
      m_pBox->setItemData( m_pBox->count() - 1, rChoice.ToolTip, Qt::ToolTipRole );
    }
    connect( m_pBox, &QComboBox::activated, this,
             [this]( int i_Index )
             {
               if ( i_Index < static_cast< int >( m_Choices.size() ) )
               {
                 emit Edited( m_Choices[static_cast< std::size_t >( i_Index )].Value );
               }
             } );
  }
  void Show( const VTypedValue& i_rValue ) override
  {
    const auto Known = std::find_if( m_Choices.begin(), m_Choices.end(),
                                     [&]( const VPreferenceItem::VChoice& i_rChoice )
                                     {
                                       return i_rChoice.Value == i_rValue;
                                     } );
    // A value that is no choice has an item of its own for as long as it holds.
    const int Count = static_cast< int >( m_Choices.size() );
    m_pBox->removeItem( Count );
    if ( Known == m_Choices.end() )
    {
      std::string Text;
      (void)ZEK::IO::ValueToText( i_rValue, Text );
      const QString Shown = Text.empty() ? tr( "Not set" ) : QString::fromStdString( Text );
      m_pBox->addItem( Text.empty() || m_Unit.isEmpty() ? Shown : Shown + QChar( QChar::Nbsp ) + m_Unit );
    }
    m_pBox->setCurrentIndex( static_cast< int >( Known - m_Choices.begin() ) );
  }

private:
  std::vector< VPreferenceItem::VChoice > m_Choices;
  QString m_Unit;
  QComboBox* m_pBox;
};

class VNumberField final : public VPreferenceField
{
public:
  VNumberField( const VPreferenceItem& i_rItem, QWidget* i_pParent )
    : VPreferenceField( i_pParent )
    , m_pBox( new VNumberBox( i_rItem, this ) )
  {
    auto* const pLayout = MakeLayout( this );
    pLayout->addWidget( m_pBox );
    pLayout->addWidget( new QLabel( i_rItem.Unit, this ) );
    pLayout->addStretch( 1 );
    setFocusProxy( m_pBox );
    m_pBox->setReadOnly( i_rItem.bReadOnly );
    connect( m_pBox, &VNumberBox::Edited, this, &VPreferenceField::Edited );
    connect( m_pBox, &VNumberBox::Refused, this, &VPreferenceField::Refused );
  }
  void Show( const VTypedValue& i_rValue ) override { m_pBox->Show( i_rValue ); }
  bool Revert() override { return m_pBox->Revert(); }

private:
  VNumberBox* m_pBox;
};

/// A String as it is, a value of any other type in its text form.
class VTextField : public VPreferenceField
{
public:
  VTextField( const VPreferenceItem& i_rItem, QWidget* i_pParent )
    : VPreferenceField( i_pParent )
    , m_pLine( new QLineEdit( this ) )
    , m_pSchema( i_rItem.pSchema )
  {
    MakeLayout( this )->addWidget( m_pLine, 1 );
    setFocusProxy( m_pLine );
    m_pLine->setReadOnly( i_rItem.bReadOnly );
    connect( m_pLine, &QLineEdit::editingFinished, this,
             [this]
             {
               Finish();
             } );
  }
  // A line that goes with the focus finishes its text once more.
  ~VTextField() override { m_pLine->disconnect( this ); }
  void Show( const VTypedValue& i_rValue ) override
  {
    std::string Text;
    if ( !ZEK::IO::ReadTyped( i_rValue, Text ) )
    {
      (void)ZEK::IO::ValueToText( i_rValue, Text );
    }
    m_Shown = QString::fromStdString( Text );
    m_pLine->setText( m_Shown );
    m_pLine->setCursorPosition( 0 );
  }
  bool Revert() override
  {
    const bool bUnfinished = m_pLine->text() != m_Shown;
    if ( bUnfinished )
    {
      m_pLine->setText( m_Shown );
      m_pLine->selectAll();
    }
    return bUnfinished;
  }

protected:
  virtual QString Cleaned( const QString& i_rText ) const { return i_rText; }
  void Finish()
  {
    const QString Text = Cleaned( m_pLine->text() );
    if ( Text == m_Shown )
    {
      m_pLine->setText( m_Shown );
      return;
    }
    VTypedValue Value = ZEK::IO::MakeValue( Text.toStdString() );
    ZEK::IO::VTextError Error;
    if ( m_pSchema->m_Type != EType::String && !ZEK::IO::ValueFromText( m_pSchema, Text.toStdString(), Value, &Error ) )
    {
      emit Refused( tr( "“%1” is not of the type %2: %3." )
                        .arg( Text, QString::fromLatin1( ZEK::IO::TypeName( m_pSchema->m_Type ) ),
                              QString::fromStdString( Error.Text() ) ) );
      return;
    }
    emit Edited( Value );
  }

  QLineEdit* m_pLine;

private:
  const ZEK::IO::ISchema* m_pSchema;
  QString m_Shown;
};

class VFolderField final : public VTextField
{
public:
  VFolderField( const VPreferenceItem& i_rItem, QWidget* i_pParent )
    : VTextField( i_rItem, i_pParent )
  {
    m_pLine->setPlaceholderText( tr( "The program's own" ) );
    auto* const pChoose = new QPushButton( tr( "Choose…" ), this );
    pChoose->setAutoDefault( false );
    pChoose->setEnabled( !i_rItem.bReadOnly );
    pChoose->setToolTip( tr( "Choose the folder for: %1" ).arg( i_rItem.Text ) );
    pChoose->setAccessibleName( pChoose->toolTip() );
    layout()->addWidget( pChoose );
    connect( pChoose, &QPushButton::clicked, this, &VFolderField::Choose );
  }

protected:
  QString Cleaned( const QString& i_rText ) const override
  {
    const QString Text = i_rText.trimmed();
    return Text.isEmpty() ? Text : QDir::cleanPath( Text );
  }

private:
  void Choose()
  {
    // No event loop of its own: this field may go while the operator chooses.
    auto* const pDialog = new QFileDialog( window(), tr( "Choose a Folder" ), m_pLine->text() );
    pDialog->setAttribute( Qt::WA_DeleteOnClose );
    pDialog->setFileMode( QFileDialog::Directory );
    pDialog->setOption( QFileDialog::ShowDirsOnly );
    connect( pDialog, &QFileDialog::fileSelected, this,
             [this]( const QString& i_rFolder )
             {
               m_pLine->setText( i_rFolder );
               Finish();
             } );
    pDialog->open();
  }
};

/// The names of an enum are choices as well.
std::vector< VPreferenceItem::VChoice > ChoicesOf( const VPreferenceItem& i_rItem )
{
  std::vector< VPreferenceItem::VChoice > Choices = i_rItem.Choices;
  const bool bEnum = i_rItem.pSchema->m_Type >= EType::Enum8 && Choices.empty();
  for ( std::size_t i = 0; bEnum && i < i_rItem.pSchema->m_EnumValues.size(); ++i )
  {
    const std::string& rName = i_rItem.pSchema->m_EnumValues[i].first;
    VTypedValue Value;
    if ( ZEK::IO::ValueFromText( i_rItem.pSchema, rName, Value ) )
    {
      Choices.push_back( { std::move( Value ), QString::fromStdString( rName ), {} } );
    }
  }
  return Choices;
}
} // namespace

VPreferenceField* MakePreferenceField( const VPreferenceItem& i_rItem, QWidget* i_pParent )
{
  std::vector< VPreferenceItem::VChoice > Choices = ChoicesOf( i_rItem );
  if ( !Choices.empty() )
  {
    return new VChoiceField( std::move( Choices ), i_rItem, i_pParent );
  }
  if ( i_rItem.pSchema->m_Type == EType::Bool )
  {
    return new VSwitchField( i_rItem, i_pParent );
  }
  if ( HostServices::IsNumber( i_rItem.pSchema ) )
  {
    return new VNumberField( i_rItem, i_pParent );
  }
  if ( i_rItem.bFolder && i_rItem.pSchema->m_Type == EType::String )
  {
    return new VFolderField( i_rItem, i_pParent );
  }
  return new VTextField( i_rItem, i_pParent );
}

} // namespace HostWindow
