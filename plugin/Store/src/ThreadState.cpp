#include "ThreadState.h"

#include <atomic>
#include <mutex>
#include <vector>

namespace Store
{
namespace
{
struct VPlaces
{
  std::mutex Guard;
  std::vector< std::size_t > Free;
  std::size_t Count = 0;
  std::uint64_t LastSerial = 0;
};

VPlaces& Places()
{
  // Never destroyed: a store may go with the last static.
  static VPlaces* const pPlaces = new VPlaces;
  return *pPlaces;
}

void Reset( VThreadState& io_rState )
{
  if ( io_rState.m_pLine != nullptr )
  {
    VReaderLines::GiveBack( *io_rState.m_pLine );
  }
  io_rState = VThreadState();
}
} // namespace

constinit thread_local std::uint64_t VThreadSlot::t_LastSerial = 0;
constinit thread_local VThreadState* VThreadSlot::t_pLast = nullptr;

struct VThreadStates
{
  std::vector< std::unique_ptr< VThreadState > > m_States;

  ~VThreadStates()
  {
    VThreadSlot::t_LastSerial = 0;
    for ( const std::unique_ptr< VThreadState >& rpState : m_States )
    {
      if ( rpState )
      {
        Reset( *rpState );
      }
    }
  }
};

VThreadSlot::VThreadSlot()
{
  VPlaces& rPlaces = Places();
  const std::lock_guard Lock( rPlaces.Guard );
  m_Serial = ++rPlaces.LastSerial;
  if ( rPlaces.Free.empty() )
  {
    rPlaces.Free.push_back( rPlaces.Count++ );
  }
  m_Place = rPlaces.Free.back();
  rPlaces.Free.pop_back();
}

VThreadSlot::~VThreadSlot()
{
  VPlaces& rPlaces = Places();
  const std::lock_guard Lock( rPlaces.Guard );
  rPlaces.Free.push_back( m_Place );
}

VThreadState& VThreadSlot::Find( const std::shared_ptr< VReaderLines >& i_rpLines )
{
  static thread_local VThreadStates t_States;
  auto& rStates = t_States.m_States;
  if ( rStates.size() <= m_Place )
  {
    rStates.resize( m_Place + 1 );
  }
  if ( !rStates[m_Place] )
  {
    rStates[m_Place] = std::make_unique< VThreadState >();
  }
  VThreadState& rState = *rStates[m_Place];
  if ( rState.m_Serial != m_Serial )
  {
    Reset( rState );
    rState.m_Serial = m_Serial;
    rState.m_pLines = i_rpLines;
    rState.m_pLine = &i_rpLines->Take();
  }
  t_LastSerial = m_Serial;
  t_pLast = &rState;
  return rState;
}

} // namespace Store
