#pragma once

#include "CallbackList.h"
#include "Delivery.h"

#include <ZEK/EntryPath.h>
#include <ZEK/HandlerCallback.h>

#include <cstdint>
#include <map>
#include <memory>
#include <mutex>

namespace Store
{

/// The callbacks on one pattern set, and what the commit under way has found for them. Lock order: store, handler,
/// list; callbacks and the release of records come after all of them.
class VHandlerCallback final : public ZEK::IHandlerCallback, public std::enable_shared_from_this< VHandlerCallback >
{
public:
  VHandlerCallback( ZEK::VEntryPatternSet i_Set, std::shared_ptr< ZEK::IPostalService > i_pService );

  const ZEK::VEntryPatternSet& Set() const { return m_Set; }

  ZEK::IHandlerCallbackProxy CreateProxy( std::uint64_t i_Mask, std::uint32_t i_Mode ) override;
  ZEK::CallbackId AddCallback( ZEK::ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode ) override;
  ZEK::CallbackId AddCallbackOn( const std::shared_ptr< ZEK::IPostalService >& i_rpService,
                                 ZEK::ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode ) override;
  ZEK::CallbackId AddImmediateCallback( ZEK::ChangeFunction i_Function, std::uint64_t i_Mask ) override;
  std::size_t RemoveCallbacksWithMask( std::uint64_t i_Mask ) override;
  bool RemoveCallback( ZEK::CallbackId i_Id ) override;
  void RemoveAllCallbacks() override;
  std::size_t CountCallbacksWithMask( std::uint64_t i_Mask ) const override;
  std::size_t CountCallbacks() const override;

  // The four steps of a commit, the first three under the store mutex.
  /// Joins the touched handlers at its first flags; one whose last reference is gone does not.
  void Touch( std::uint64_t i_Flags, VDelivery& io_rDelivery )
  {
    const bool bFirst = m_Accumulated == 0 && i_Flags != 0;
    m_Accumulated |= i_Flags;
    if ( bFirst )
    {
      Join( io_rDelivery );
    }
  }
  void Forget() { m_Accumulated = 0; }
  void Collect( ZEK::ChangeId i_Id, VDelivery& io_rDelivery );
  void GatherPosts( ZEK::ChangeId i_Id, VOutbox& io_rOutbox );

private:
  using VPostedLists = std::map< std::shared_ptr< ZEK::IPostalService >, std::shared_ptr< VCallbackList > >;

  void Join( VDelivery& io_rDelivery );
  VCallbackRecord MakeRecord( ZEK::ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode );
  std::size_t RemoveIf( const std::function< bool( const VCallbackRecord& ) >& i_rWanted );
  template < typename TVisit >
  void ForEachList( const TVisit& i_rVisit ) const;

  const ZEK::VEntryPatternSet m_Set;
  std::uint64_t m_Accumulated = 0; ///< store mutex
  mutable std::mutex m_Mutex;
  const std::shared_ptr< ZEK::IPostalService > m_pService;
  std::shared_ptr< VCallbackList > m_pImmediate; ///< null while there is none
  VPostedLists m_Posted;
};

} // namespace Store
