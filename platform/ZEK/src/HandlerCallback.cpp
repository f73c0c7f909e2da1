#include <ZEK/HandlerCallback.h>

#include <utility>

namespace ZEK
{

const char* VDeregisterWeakCallbackException::what() const noexcept
{
  return "the callback asks to be removed";
}

IHandlerCallbackProxy::IHandlerCallbackProxy( std::shared_ptr< IHandlerCallback > i_pHandler, std::uint64_t i_Mask,
                                              std::uint32_t i_Mode )
  : m_pHandler( std::move( i_pHandler ) )
  , m_Mask( i_Mask )
  , m_Mode( i_Mode )
{
}

CallbackId IHandlerCallbackProxy::Connect( ChangeFunction i_Function )
{
  return m_pHandler->AddCallback( std::move( i_Function ), m_Mask, m_Mode );
}

bool IHandlerCallbackProxy::Disconnect( CallbackId i_Id )
{
  return m_pHandler->RemoveCallback( i_Id );
}

std::size_t IHandlerCallbackProxy::DisconnectAll()
{
  return m_pHandler->RemoveCallbacksWithMask( m_Mask );
}

std::size_t IHandlerCallbackProxy::Count() const
{
  return m_pHandler->CountCallbacksWithMask( m_Mask );
}

VConnection IHandlerCallbackProxy::Connect( ChangeFunction i_Function, std::shared_ptr< IPostalService > i_pService )
{
  const CallbackId Id =
      i_pService ? ConnectOn( std::move( i_Function ), i_pService ) : ConnectImmediate( std::move( i_Function ) );
  return VConnection(
      [pWeak = std::weak_ptr( m_pHandler ), Id]
      {
        if ( const auto pHandler = pWeak.lock() )
        {
          pHandler->RemoveCallback( Id );
        }
      } );
}

CallbackId IHandlerCallbackProxy::ConnectOn( ChangeFunction i_Function,
                                             const std::shared_ptr< IPostalService >& i_rpService )
{
  return m_pHandler->AddCallbackOn( i_rpService, std::move( i_Function ), m_Mask, m_Mode );
}

CallbackId IHandlerCallbackProxy::ConnectImmediate( ChangeFunction i_Function )
{
  return m_pHandler->AddImmediateCallback( std::move( i_Function ), m_Mask );
}

} // namespace ZEK
