#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <utility>
#include <vector>

// The same join over plain structures: no states, no time, one requirement for all.
namespace JoinFloor
{

struct VId
{
  std::uint32_t A = 0, B = 0;
  std::int64_t C = 0;
  bool operator==( const VId& ) const = default;
};
struct VItem
{
  VId Id;
  std::string Name;
  const void* pValue = nullptr;
};
struct VState
{
  std::vector< std::vector< const VItem* > > Kinds;
  std::vector< std::unique_ptr< VItem > > Items;
};

/// Every kind of every object, in the order in which objects arrive.
VState Make( int i_Objects, int i_Kinds, std::int64_t i_Identity, int i_Names );
/// The name of an object and the place in the order of arrival at which one kind has it.
std::string NameOf( int i_Names, int i_Object );
int ObjectAt( int i_Place, int i_Kind, int i_Objects );

/// Through a hash map made anew every frame, and the names sorted.
class VFlat
{
public:
  void Join( const VState& i_rState );

  std::vector< std::string_view > Names;
  std::vector< std::vector< const VItem* > > Values;
  std::vector< std::vector< VId > > Ids, PreviousIds;
  std::vector< char > Changed;

private:
  struct VRow
  {
    std::string_view Name;
    std::uint32_t Hits = 0, Last = 0, Index = 0;
  };
  std::unordered_map< std::string_view, std::uint32_t > m_Map;
  std::vector< VRow > m_Rows;
  std::vector< std::vector< std::pair< std::uint32_t, const VItem* > > > m_Hits;
  std::vector< std::uint32_t > m_Order;
};

/// Keeps the slots of the frame before while every item stands where it stood; else goes the long way.
class VKept
{
public:
  void Join( const VState& i_rState );

  std::vector< std::vector< const VItem* > > Values;

private:
  bool Keep( const VState& i_rState );
  std::vector< std::vector< std::uint32_t > > m_Slots;
  std::vector< std::string > m_Names;
  std::vector< std::vector< VId > > m_Ids;
  std::vector< char > m_Changed;
  VFlat m_Full;
};

} // namespace JoinFloor
