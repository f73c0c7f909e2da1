#pragma once

#include <ZEK/Store.h>

#include <QtCore/QString>

#include <vector>

namespace HostWindow
{

/// What an operator sees of a preference, apart from its value.
struct VPreferenceItem
{
  struct VChoice
  {
    ZEK::VTypedValue Value;
    QString Text;
    QString ToolTip;
    friend bool operator==( const VChoice&, const VChoice& ) = default;
  };

  ZEK::IStoreReader::Entry pEntry = nullptr;
  const ZEK::IO::ISchema* pSchema = nullptr;
  QString Text;
  QString ToolTip;
  QString Unit;
  ZEK::VTypedValue Minimum;
  ZEK::VTypedValue Maximum;
  ZEK::VTypedValue Default;
  QString DefaultText;
  std::uint32_t Place = 0;
  std::uint32_t Step = 0;
  std::vector< VChoice > Choices;
  bool bFolder = false;
  bool bReadOnly = false;
  friend bool operator==( const VPreferenceItem&, const VPreferenceItem& ) = default;
};

/// The preferences of one branch of the store.
struct VPreferenceSection
{
  QString Title;
  QString Text;
  std::vector< VPreferenceItem > Items;
  friend bool operator==( const VPreferenceSection&, const VPreferenceSection& ) = default;
};

/// The entries below `i_pRoot` that have a type and a presentation text, branch by branch, in the order that they ask
/// for; see HostServices/PreferenceRules.h for what the fields mean. Branches without any are left out. References to
/// the entries' fields are not kept.
std::vector< VPreferenceSection > ReadPreferenceItems( const ZEK::IStoreReader& i_rReader,
                                                       ZEK::IStoreReader::Entry i_pRoot );

/// Whether each word of the search stands somewhere in the texts of the item or of its section, in any case.
bool MatchesSearch( const VPreferenceSection& i_rSection, const VPreferenceItem& i_rItem, const QString& i_rSearch );

} // namespace HostWindow
