#pragma once

#include <Store/Store.h>
#include <VStore.h>
#include <ZEK/Serialiser.h>

#include <cstdint>
#include <deque>
#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

namespace Store
{

inline ZEK::VTypedValue Int( std::int32_t i_Value )
{
  return ZEK::IO::MakeValue( i_Value );
}

/// A service whose functions run when the test says so.
class VManualService final : public ZEK::IPostalService
{
public:
  void Post( std::function< void() > i_Function ) override
  {
    const std::lock_guard Lock( m_Guard );
    m_Functions.push_back( std::move( i_Function ) );
  }
  std::size_t Waiting() const
  {
    const std::lock_guard Lock( m_Guard );
    return m_Functions.size();
  }
  /// False when there is nothing to run.
  bool RunOne()
  {
    std::function< void() > Function;
    {
      const std::lock_guard Lock( m_Guard );
      if ( m_Functions.empty() )
      {
        return false;
      }
      Function = std::move( m_Functions.front() );
      m_Functions.pop_front();
    }
    Function();
    return true;
  }
  void RunAll()
  {
    while ( RunOne() )
    {
    }
  }

private:
  mutable std::mutex m_Guard;
  std::deque< std::function< void() > > m_Functions;
};

/// What callbacks were told, in order.
struct VHeard
{
  struct VCall
  {
    std::string m_Who;
    std::uint64_t m_Flags;
    std::uint64_t m_Id;
    friend bool operator==( const VCall&, const VCall& ) = default;
  };
  std::vector< VCall > m_Calls;

  ZEK::ChangeFunction As( std::string i_Who )
  {
    return [this, Who = std::move( i_Who )]( ZEK::IBitFlags< ZEK::EChangeFlags > i_Flags, ZEK::ChangeId i_Id )
    {
      m_Calls.push_back( { Who, i_Flags.Bits(), i_Id.Value() } );
    };
  }
  std::vector< VCall > Take() { return std::exchange( m_Calls, {} ); }
};

inline void PrintTo( const VHeard::VCall& i_rCall, std::ostream* o_pStream )
{
  *o_pStream << i_rCall.m_Who << " " << std::hex << i_rCall.m_Flags << std::dec << " @" << i_rCall.m_Id;
}

/// A store with the inside at hand.
struct VTestStore
{
  std::shared_ptr< VManualService > m_pService = std::make_shared< VManualService >();
  std::shared_ptr< VStore > m_pStore;

  explicit VTestStore( std::size_t i_Buckets = 64 )
    : m_pStore( ZEK::MakeShared< VStore >( m_pService, i_Buckets ) )
  {
  }
  VStoreEntry* operator[]( const char* i_pPath ) const { return m_pStore->GetEntry( i_pPath ); }
  template < typename TWork >
  void Write( const TWork& i_rWork ) const
  {
    ZEK::VStoreWriteScope Scope( *m_pStore );
    i_rWork( *Scope );
  }
  template < typename TWork >
  auto Read( const TWork& i_rWork ) const
  {
    ZEK::VStoreReadScope Scope( *m_pStore );
    return i_rWork( *Scope );
  }
  void Set( const char* i_pPath, std::int32_t i_Value ) const
  {
    Write(
        [&]( ZEK::IStoreWriter& io_rWriter )
        {
          (void)io_rWriter.SetValue( ( *this )[i_pPath], Int( i_Value ) );
        } );
  }
  std::shared_ptr< ZEK::IHandlerCallback > OnEntry( const char* i_pPath ) const
  {
    return m_pStore->RegisterHandler( { { ( *this )[i_pPath] }, {} } );
  }
  std::shared_ptr< ZEK::IHandlerCallback > OnPattern( const char* i_pPath ) const
  {
    return m_pStore->RegisterHandler( { {}, { i_pPath } } );
  }
};

} // namespace Store
