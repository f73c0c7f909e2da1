#pragma once

#include "Entry.h"

#include <ZEK/EntryPath.h>

#include <map>
#include <memory>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace Store
{

/// The paths that handlers listen to, as a tree of components. The store mutex guards it.
class VPatternTree
{
public:
  VPatternTree() = default;
  VPatternTree( const VPatternTree& ) = delete;
  VPatternTree& operator=( const VPatternTree& ) = delete;
  ~VPatternTree();

  void Add( const ZEK::VEntryPath& i_rPattern, VHandlerCallback& i_rHandler );
  /// Takes the handler off that pattern once for all times it was added, and nodes that are of no use with it.
  void Remove( const ZEK::VEntryPath& i_rPattern, const VHandlerCallback& i_rHandler );
  /// Appends the handlers of all patterns that name the entry, as reading by the pattern would find it.
  void Match( const VStoreEntry& i_rEntry, VHandlerList& io_rHandlers ) const;
  bool IsEmpty() const { return m_Root.IsUnused(); }

private:
  struct VNode
  {
    bool IsUnused() const { return m_Children.empty() && m_Handlers.empty(); }

    std::map< std::string, std::unique_ptr< VNode >, std::less<> > m_Children;
    VHandlerList m_Handlers;
  };

  void MatchPatterns( std::optional< std::string_view > i_Names, VHandlerList& io_rHandlers ) const;
  const VNode* FindName( const ZEK::VEntryPath& i_rPath ) const;

  VNode m_Root;
};

} // namespace Store
