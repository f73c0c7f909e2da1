#pragma once

#include "Delivery.h"

#include <ZEK/HandlerCallback.h>

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <mutex>
#include <vector>

namespace Store
{

struct VCallbackRecord
{
  std::shared_ptr< const ZEK::ChangeFunction > m_pFunction; ///< its address is the id
  std::uint64_t m_Mask = 0;
  std::uint32_t m_Mode = 0;
  std::uint64_t m_Pending = 0;                  ///< flags not yet delivered; list mutex
  std::shared_ptr< VHandlerCallback > m_pOwner; ///< the handler lives as long as a record
};

/// Records lie in an array that adding and removing replace: a pass takes the array and calls without a lock. Of a
/// kept array only the pending flags change, and only the newest array's count.
using VRecordArray = std::vector< VCallbackRecord >;

/// Arrays that were replaced; releasing them may end handlers, so they go when no lock is held.
using VOldArrays = std::vector< std::shared_ptr< VRecordArray > >;

/// The callbacks of a handler that are called in one place: at the end of the commit, or on one service's thread.
class VCallbackList
{
public:
  ZEK::CallbackId Add( VCallbackRecord i_Record );
  /// Returns how many were removed.
  std::size_t RemoveIf( const std::function< bool( const VCallbackRecord& ) >& i_rWanted, VOldArrays& io_rOld );

  std::size_t Count() const;
  std::size_t CountWithMask( std::uint64_t i_Mask ) const;
  bool IsEmpty() const { return Count() == 0; }
  /// Some record may want one of the flags: exact while nobody adds or removes.
  bool Wants( std::uint64_t i_Flags ) const { return ( m_Masks.load( std::memory_order_acquire ) & i_Flags ) != 0; }

  /// Notes the flags of a commit for later delivery.
  void Accumulate( std::uint64_t i_Flags, ZEK::ChangeId i_Id );
  bool HasWork() const;

  /// Calls those that want one of the flags, with all of them.
  void RunNow( std::uint64_t i_Flags, ZEK::ChangeId i_Id, VFirstFailure& io_rFailure );
  /// Delivers what has accumulated, on behalf of the commit `i_Id`.
  void RunPosted( ZEK::ChangeId i_Id, VFirstFailure& io_rFailure );

private:
  struct VCall
  {
    const VCallbackRecord* m_pRecord;
    std::uint64_t m_Flags;
  };
  std::shared_ptr< VRecordArray > TakeCalls( ZEK::ChangeId i_Id, ZEK::ChangeId& o_rNewest,
                                             std::vector< VCall >& o_rCalls );
  void RemoveAll( const std::vector< ZEK::CallbackId >& i_rIds );

  void Replace( std::shared_ptr< VRecordArray > i_pNew );

  mutable std::mutex m_Mutex;
  std::atomic< std::uint64_t > m_Masks{ 0 }; ///< of all records
  std::shared_ptr< VRecordArray > m_pRecords = std::make_shared< VRecordArray >();
  bool m_bHasWork = false;
  ZEK::ChangeId m_Newest;
};

} // namespace Store
