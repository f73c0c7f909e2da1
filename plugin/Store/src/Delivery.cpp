#include "Delivery.h"

#include "CallbackList.h"

#include <algorithm>
#include <utility>

namespace Store
{

void VOutbox::Add( const std::shared_ptr< ZEK::IPostalService >& i_rpService, ZEK::ChangeId i_Id,
                   std::shared_ptr< VCallbackList > i_pList )
{
  auto It = std::find_if( m_Parcels.begin(), m_Parcels.end(),
                          [&]( const VParcel& i_rParcel )
                          {
                            return i_rParcel.m_pService == i_rpService;
                          } );
  if ( It == m_Parcels.end() )
  {
    It = m_Parcels.insert( It, VParcel{ i_rpService, {} } );
  }
  It->m_Items.push_back( { i_Id, std::move( i_pList ) } );
}

void VOutbox::Send( VFirstFailure& io_rFailure )
{
  // A service may run the function at once, and that may commit.
  for ( VParcel& rParcel : std::exchange( m_Parcels, {} ) )
  {
    io_rFailure.Try(
        [&]
        {
          rParcel.m_pService->Post(
              [Items = std::move( rParcel.m_Items )]
              {
                VFirstFailure Failure;
                for ( const VItem& rItem : Items )
                {
                  rItem.m_pList->RunPosted( rItem.m_Id, Failure );
                }
                Failure.Rethrow();
              } );
        } );
  }
}

} // namespace Store
