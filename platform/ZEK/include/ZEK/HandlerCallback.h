#pragma once

#include <ZEK/BitFlags.h>
#include <ZEK/Callback.h>
#include <ZEK/Export.h>
#include <ZEK/StoreFlags.h>
#include <ZEK/TypedId.h>

#include <cstddef>
#include <cstdint>
#include <exception>
#include <functional>
#include <memory>

namespace ZEK
{

/// A callback gets what changed, and the number of the commit.
using ChangeSignature = void( IBitFlags< EChangeFlags >, ChangeId );
using ChangeFunction = std::function< ChangeSignature >;

/// Names a callback until it is removed; a later one may then get the same id, so forget it. Null names none.
using CallbackId = const void*;

/// Thrown by a callback that wants to be removed; it is, after all calls of the pass.
class ZEK_API VDeregisterWeakCallbackException : public std::exception
{
public:
  const char* what() const noexcept override;
};

class IHandlerCallback;

/// A handler with a mask and a mode, so that callbacks come and go without repeating them. A value; it keeps its
/// handler alive.
class ZEK_API IHandlerCallbackProxy final : public IMultiCallbackPostal< ChangeSignature >
{
public:
  IHandlerCallbackProxy( std::shared_ptr< IHandlerCallback > i_pHandler, std::uint64_t i_Mask, std::uint32_t i_Mode );

  /// Posted to the store's own service.
  CallbackId Connect( ChangeFunction i_Function );
  bool Disconnect( CallbackId i_Id );
  /// Removes the callbacks with exactly the proxy's mask, whoever added them; returns how many.
  std::size_t DisconnectAll();
  /// The number of callbacks with exactly the proxy's mask.
  std::size_t Count() const;
  /// As the other `Connect`, on a given service; a null service makes it immediate. The connection removes the
  /// callback at its end and may outlive the store.
  [[nodiscard]] VConnection Connect( ChangeFunction i_Function, std::shared_ptr< IPostalService > i_pService ) override;
  CallbackId ConnectOn( ChangeFunction i_Function, const std::shared_ptr< IPostalService >& i_rpService );
  CallbackId ConnectImmediate( ChangeFunction i_Function );

private:
  std::shared_ptr< IHandlerCallback > m_pHandler;
  std::uint64_t m_Mask;
  std::uint32_t m_Mode;
};

/// The callbacks on one pattern set of a store.
///
/// A callback is called when a commit changed something that its mask names, and then gets all the flags that
/// came together, not only those of its mask. Every callback keeps its handler alive: who adds one removes it, or
/// throws `VDeregisterWeakCallbackException` in it. An empty function is taken and fails when it is called.
/// Thread: any, also from inside a callback. A callback that is removed during a pass may still get that call.
class IHandlerCallback
{
public:
  /// A call for every delivery, with the flags since the last one.
  static constexpr std::uint32_t EveryDelivery = 0;
  /// A posted callback that is behind by several commits is called once, for the newest, with all their flags.
  static constexpr std::uint32_t LatestOnly = 1;

  virtual ~IHandlerCallback() = default;
  virtual IHandlerCallbackProxy CreateProxy( std::uint64_t i_Mask, std::uint32_t i_Mode ) = 0;
  /// Posted to the store's own service; null when the store has none.
  virtual CallbackId AddCallback( ChangeFunction i_Function, std::uint64_t i_Mask, std::uint32_t i_Mode ) = 0;
  /// Posted to that service; null for a null service.
  virtual CallbackId AddCallbackOn( const std::shared_ptr< IPostalService >& i_rpService, ChangeFunction i_Function,
                                    std::uint64_t i_Mask, std::uint32_t i_Mode ) = 0;
  /// Called at the end of the commit on the thread that made it, with no lock held.
  virtual CallbackId AddImmediateCallback( ChangeFunction i_Function, std::uint64_t i_Mask ) = 0;
  /// Removes the callbacks whose mask is exactly this one; returns how many.
  virtual std::size_t RemoveCallbacksWithMask( std::uint64_t i_Mask ) = 0;
  virtual bool RemoveCallback( CallbackId i_Id ) = 0;
  virtual void RemoveAllCallbacks() = 0;
  virtual std::size_t CountCallbacksWithMask( std::uint64_t i_Mask ) const = 0;
  virtual std::size_t CountCallbacks() const = 0;
};

} // namespace ZEK
