#include "PreferenceItems.h"

#include <HostServices/PreferenceRules.h>

#include <ZEK/StoreFlags.h>

#include <QtCore/QCoreApplication>
#include <QtCore/QStringList>

#include <tuple>

namespace HostWindow
{
namespace
{
using ZEK::IStoreReader;

/// A file may hold a tree of any depth; nobody reads settings below this one.
constexpr int DeepestBranch = 16;

QString Tr( const char* i_pText )
{
  return QCoreApplication::translate( "HostWindow::PreferenceItems", i_pText );
}

QString ToolTipOf( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry, const VPreferenceItem& i_rItem )
{
  QStringList Sentences;
  Sentences << QString::fromStdString( i_rReader.OptionalText( i_pEntry ).value_or( std::string() ) );
  const QString Range = HostServices::RangeText( i_rItem.Minimum, i_rItem.Maximum, i_rItem.Unit );
  Sentences << ( Range.isEmpty() ? QString() : Tr( "It takes numbers %1." ).arg( Range ) );
  Sentences << ( i_rItem.DefaultText.isEmpty() ? QString() : Tr( "Default: %1." ).arg( i_rItem.DefaultText ) );
  Sentences.removeAll( QString() );
  return Sentences.join( QLatin1Char( ' ' ) );
}

VPreferenceItem ReadItem( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry )
{
  VPreferenceItem Item;
  Item.pEntry = i_pEntry;
  Item.pSchema = i_rReader.Schema( i_pEntry );
  Item.Text = QString::fromStdString( i_rReader.PresentationText( i_pEntry ) );
  Item.Unit = QString::fromStdString( i_rReader.ExtraText1( i_pEntry ) );
  Item.Minimum = i_rReader.Minimum( i_pEntry );
  Item.Maximum = i_rReader.Maximum( i_pEntry );
  Item.Default = i_rReader.DefaultValue( i_pEntry );
  Item.DefaultText = HostServices::ValueForPeople( i_rReader, i_pEntry, Item.Default );
  Item.Place = i_rReader.ExtraNumber1( i_pEntry );
  Item.Step = std::max( i_rReader.ExtraNumber2( i_pEntry ), 1u );
  Item.bFolder = i_rReader.ExtraText2( i_pEntry ) == HostServices::FolderKind;
  Item.bReadOnly = ( i_rReader.Flags( i_pEntry ) & ZEK::EReadout ) != 0;
  const std::vector< std::string >& rToolTips = i_rReader.ChoiceToolTips( i_pEntry );
  for ( const ZEK::VTypedValue& rValue : i_rReader.Choices( i_pEntry ) )
  {
    const std::size_t Index = Item.Choices.size();
    Item.Choices.push_back( { rValue, HostServices::ValueForPeople( i_rReader, i_pEntry, rValue ),
                              Index < rToolTips.size() ? QString::fromStdString( rToolTips[Index] ) : QString() } );
  }
  Item.ToolTip = ToolTipOf( i_rReader, i_pEntry, Item );
  return Item;
}

/// Entries that ask for no place come last, by their names.
std::vector< IStoreReader::Entry > ChildrenInOrder( const IStoreReader& i_rReader, IStoreReader::Entry i_pEntry )
{
  std::vector< IStoreReader::Entry > Children = i_rReader.Children( i_pEntry );
  std::stable_sort( Children.begin(), Children.end(),
                    [&]( IStoreReader::Entry i_pA, IStoreReader::Entry i_pB )
                    {
                      // 0 wraps to the greatest number.
                      return i_rReader.ExtraNumber1( i_pA ) - 1 < i_rReader.ExtraNumber1( i_pB ) - 1;
                    } );
  return Children;
}

void ReadBranch( const IStoreReader& i_rReader, IStoreReader::Entry i_pBranch, int i_Depth,
                 std::vector< VPreferenceSection >& o_rSections )
{
  VPreferenceSection Section;
  const std::string& rTitle = i_rReader.PresentationText( i_pBranch );
  Section.Title =
      QString::fromStdString( rTitle.empty() ? i_rReader.GetStore()->EntryPath( i_pBranch ).Leaf() : rTitle );
  Section.Text = QString::fromStdString( i_rReader.OptionalText( i_pBranch ).value_or( std::string() ) );
  const std::vector< IStoreReader::Entry > Children = ChildrenInOrder( i_rReader, i_pBranch );
  for ( const IStoreReader::Entry pChild : Children )
  {
    if ( !i_rReader.PresentationText( pChild ).empty() && i_rReader.Schema( pChild )->m_Type != ZEK::IO::EType::Void )
    {
      Section.Items.push_back( ReadItem( i_rReader, pChild ) );
    }
  }
  if ( !Section.Items.empty() )
  {
    o_rSections.push_back( std::move( Section ) );
  }
  for ( const IStoreReader::Entry pChild : Children )
  {
    if ( i_Depth < DeepestBranch && i_rReader.HasChildren( pChild ) )
    {
      ReadBranch( i_rReader, pChild, i_Depth + 1, o_rSections );
    }
  }
}
} // namespace

std::vector< VPreferenceSection > ReadPreferenceItems( const ZEK::IStoreReader& i_rReader,
                                                       ZEK::IStoreReader::Entry i_pRoot )
{
  std::vector< VPreferenceSection > Sections;
  ReadBranch( i_rReader, i_pRoot, 0, Sections );
  return Sections;
}

bool MatchesSearch( const VPreferenceSection& i_rSection, const VPreferenceItem& i_rItem, const QString& i_rSearch )
{
  QStringList Texts{ i_rSection.Title, i_rItem.Text, i_rItem.ToolTip };
  for ( const VPreferenceItem::VChoice& rChoice : i_rItem.Choices )
  {
    Texts << rChoice.Text << rChoice.ToolTip;
  }
  const QString Everything = Texts.join( QLatin1Char( '\n' ) );
  const QStringList Words = i_rSearch.split( QLatin1Char( ' ' ), Qt::SkipEmptyParts );
  return std::all_of( Words.begin(), Words.end(),
                      [&]( const QString& i_rWord )
                      {
                        return Everything.contains( i_rWord, Qt::CaseInsensitive );
                      } );
}

} // namespace HostWindow
