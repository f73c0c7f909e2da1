#pragma once

#include <ZEK/Callback.h>
#include <ZEK/TypedId.h>

#include <cstdint>
#include <exception>
#include <memory>
#include <vector>

namespace Store
{

class VCallbackList;
class VHandlerCallback;

/// The first exception of several calls that are all made.
class VFirstFailure
{
public:
  template < typename TCall >
  void Try( const TCall& i_rCall )
  {
    try
    {
      i_rCall();
    }
    catch ( ... )
    {
      Keep();
    }
  }
  /// To be called while an exception is handled.
  void Keep()
  {
    if ( !m_pFailure )
    {
      m_pFailure = std::current_exception();
    }
  }
  void Rethrow() const
  {
    if ( m_pFailure )
    {
      std::rethrow_exception( m_pFailure );
    }
  }

private:
  std::exception_ptr m_pFailure;
};

/// What one commit has to tell, in the order in which handlers were first touched.
struct VDelivery
{
  struct VImmediate
  {
    std::shared_ptr< VCallbackList > m_pList;
    std::uint64_t m_Flags;
  };
  std::vector< std::shared_ptr< VHandlerCallback > > m_Touched;
  std::vector< VImmediate > m_Immediate;
  bool m_bPosts = false; ///< a touched handler has callbacks on services

  /// Releases handlers, so never under a lock.
  void Clear()
  {
    m_bPosts = false;
    m_Immediate.clear();
    m_Touched.clear();
  }
};

/// What a thread has to post when the outermost of its commits is done: one function a service.
class VOutbox
{
public:
  void Add( const std::shared_ptr< ZEK::IPostalService >& i_rpService, ZEK::ChangeId i_Id,
            std::shared_ptr< VCallbackList > i_pList );
  bool IsEmpty() const { return m_Parcels.empty(); }
  void Send( VFirstFailure& io_rFailure );

private:
  struct VItem
  {
    ZEK::ChangeId m_Id;
    std::shared_ptr< VCallbackList > m_pList;
  };
  struct VParcel
  {
    std::shared_ptr< ZEK::IPostalService > m_pService;
    std::vector< VItem > m_Items;
  };
  std::vector< VParcel > m_Parcels;
};

} // namespace Store
