#pragma once

#include "EntryTable.h"
#include "GenerationLock.h"
#include "HandlerRegistry.h"
#include "Merge.h"
#include "Pending.h"
#include "StoreReader.h"
#include "StoreWriter.h"
#include "ThreadState.h"

#include <ZEK/Shared.h>
#include <ZEK/Store.h>

#include <atomic>
#include <memory>
#include <vector>

namespace Store
{

/// The tree, its scopes and its handlers. Made by `ZEK::MakeShared`.
///
/// One mutex guards the making of handles, the generation lock, merging, and the handler registry. Committed states
/// are read without it inside scopes, and pending records belong to the thread of the write scope.
class VStore final : public ZEK::IStore, public ZEK::VShared
{
public:
  VStore( std::shared_ptr< ZEK::IPostalService > i_pService, std::size_t i_BucketCount );
  /// Callbacks of handlers that are still alive are removed.
  ~VStore() override;

  const ZEK::VEntryPath& GetEntryPath( const ZEK::VEntryPath& i_rPath ) override;
  ZEK::IResult Shutdown() override;
  VStoreEntry* GetRootEntry() override { return &m_Table.Root(); }
  VStoreEntry* GetEntry( const ZEK::VEntryPath& i_rPath ) override;
  const ZEK::VEntryPath& EntryPath( const VStoreEntry* i_pEntry ) const override;
  ZEK::IStoreReader* BeginRead() override;
  void EndRead() override;
  ZEK::IStoreWriter* BeginWrite() override;
  void EndWrite() override;
  std::shared_ptr< ZEK::IHandlerCallback > RegisterHandler( const ZEK::VEntryPatternSet& i_rSet ) override;
  std::size_t HandlerCount() const override;
  VStoreEntry* FindEntry( const ZEK::VEntryPath& i_rPath ) const override { return m_Table.Find( i_rPath ); }

  /// Null when the store is being destroyed.
  std::shared_ptr< VStore > Self() const;
  const VEntryTable& Table() const { return m_Table; }
  VPending& Pending() { return m_Pending; }
  std::uint64_t LastCommit() const { return m_Lock.LastCommit(); }
  const VStoreReader& Reader() const { return m_Reader; }
  bool IsAtRest() const { return m_Lock.IsAtRest(); }
  /// For the end of the commit; thread of the write scope.
  void Queue( VQueuedRequest i_Request ) { m_Requests.push_back( std::move( i_Request ) ); }
  void Defer( std::function< void() > i_Function );

private:
  struct VHandlerDeleter;

  VThreadState& Thread() const { return m_Slot.Get( m_Lock.Lines() ); }
  std::shared_ptr< VHandlerCallback > MakeHandler( const ZEK::VEntryPatternSet& i_rSet );
  void EndOutermost( VThreadState& io_rThread, VDelivery& io_rDelivery );
  /// Merges under the mutex.
  ZEK::ChangeId Commit( VDelivery& io_rDelivery );
  void Deliver( VThreadState& io_rThread, VDelivery& io_rDelivery, ZEK::ChangeId i_Id, VFirstFailure& io_rFailure );
  static void RunDeferred( VThreadState& io_rThread, VFirstFailure& io_rFailure );

  VGenerationLock m_Lock;
  mutable VThreadSlot m_Slot;
  const std::shared_ptr< ZEK::IPostalService > m_pService;
  VEntryTable m_Table;
  VPending m_Pending;
  VHandlerRegistry m_Registry;
  std::vector< VQueuedRequest > m_Requests;
  bool m_bClosing = false; ///< store mutex
  VStoreReader m_Reader;
  VStoreWriter m_Writer;
};

} // namespace Store
