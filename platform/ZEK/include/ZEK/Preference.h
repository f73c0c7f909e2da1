#pragma once

#include <ZEK/Callback.h>
#include <ZEK/DebugServices.h>
#include <ZEK/HandlerCallback.h>
#include <ZEK/Serialiser.h>
#include <ZEK/Store.h>
#include <ZEK/StoreValue.h>

#include <cstdint>
#include <memory>
#include <utility>

namespace ZEK
{

/// What everyone has to know of a preference: where it lies, and its default, whose type is that of the entry.
struct VPreferenceDeclaration
{
  VEntryPath m_Path;
  VTypedValue m_Default;
};

/// A preference in a store. Its handle is looked up when it is first asked for. A value; the store outlives it.
/// Thread: one at a time. Without a store the default holds.
template < typename T >
class VPreference
{
public:
  /// The declaration outlives the preference and is of type `T`.
  VPreference( IStore* i_pStore, const VPreferenceDeclaration& i_rDeclaration )
    : m_pStore( i_pStore )
    , m_pDeclaration( &i_rDeclaration )
  {
    DebugServices::Check( i_rDeclaration.m_Default.Schema() == IO::VSerialiser< T >::Schema(),
                          "a preference is read as it is declared", __FILE__, __LINE__ );
  }

  const VEntryPath& Path() const { return m_pDeclaration->m_Path; }
  T Default() const
  {
    T Value{};
    (void)IO::ReadTyped( m_pDeclaration->m_Default, Value );
    return Value;
  }
  /// Null without a store; says nothing about whether the entry is there.
  ::Store::VStoreEntry* Entry() const
  {
    if ( m_pEntry == nullptr && m_pStore != nullptr )
    {
      m_pEntry = m_pStore->GetEntry( Path() );
    }
    return m_pEntry;
  }

  /// Reads in a scope of the same store. `NotFound` or `NotSet` with the default when there is no value; after
  /// `InvalidType` and `Failed` the value is as it was. Each writes a line in the log category "Store".
  IResult Read( const IStoreReader& i_rReader, T& io_rValue ) const
  {
    const IResult Result = ReadValue( i_rReader, Entry(), io_rValue );
    if ( Result == IResult::NotFound || Result == IResult::NotSet )
    {
      io_rValue = Default();
    }
    return Result;
  }
  /// Reads in a scope of its own. Without a store the default, `NotFound`, and no line.
  IResult Read( T& io_rValue ) const
  {
    if ( m_pStore == nullptr )
    {
      io_rValue = Default();
      return IResult::NotFound;
    }
    const VStoreReadScope Scope( *m_pStore );
    return Read( *Scope, io_rValue );
  }
  /// The value of the entry, or a `VStoreException`; the default is not asked.
  T Get( const IStoreReader& i_rReader ) const { return GetValue< T >( i_rReader, Entry() ); }

  /// Tells of new values, or of what the mask names: once for several that are waiting. That an entry was removed is
  /// no new value. The service is that of `IHandlerCallbackProxy::Connect`; without a store nothing is connected.
  [[nodiscard]] VConnection Connect( ChangeFunction i_Function, std::shared_ptr< IPostalService > i_pService,
                                     std::uint64_t i_Mask = EChangeVerified ) const
  {
    if ( m_pStore == nullptr )
    {
      return {};
    }
    return m_pStore->RegisterHandler( { { Entry() }, {} } )
        ->CreateProxy( i_Mask, IHandlerCallback::LatestOnly )
        .Connect( std::move( i_Function ), std::move( i_pService ) );
  }

private:
  IStore* m_pStore;
  const VPreferenceDeclaration* m_pDeclaration;
  mutable ::Store::VStoreEntry* m_pEntry = nullptr;
};

} // namespace ZEK
