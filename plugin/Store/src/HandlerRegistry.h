#pragma once

#include "EntryTable.h"
#include "HandlerCallback.h"
#include "PatternTree.h"

#include <ZEK/EntryPath.h>

#include <cstddef>
#include <functional>
#include <map>
#include <memory>
#include <vector>

namespace Store
{

/// The handlers of a store by pattern set. The store mutex guards it.
class VHandlerRegistry
{
public:
  explicit VHandlerRegistry( VEntryTable& io_rTable )
    : m_rTable( io_rTable )
  {
  }

  /// The living handler of the set, or the one that `i_rMake` makes.
  std::shared_ptr< VHandlerCallback >
  FindOrMake( const ZEK::VEntryPatternSet& i_rSet,
              const std::function< std::shared_ptr< VHandlerCallback >() >& i_rMake );
  /// Takes a handler that has no reference left off everything that knows it.
  void Forget( const VHandlerCallback& i_rHandler );
  /// Gives a state that was just made the handlers whose patterns name its entry.
  void Match( VStoreEntry& io_rEntry ) const { m_Patterns.Match( io_rEntry, io_rEntry.m_PatternHandlers ); }

  std::size_t Count() const { return m_Handlers.size(); }
  bool HasPatterns() const { return !m_Patterns.IsEmpty(); }
  std::vector< std::shared_ptr< VHandlerCallback > > Living() const;

private:
  VEntryTable& m_rTable;
  VPatternTree m_Patterns;
  std::map< ZEK::VEntryPatternSet, std::weak_ptr< VHandlerCallback > > m_Handlers;
};

} // namespace Store
