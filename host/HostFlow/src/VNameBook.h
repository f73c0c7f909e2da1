#pragma once

#include <atomic>
#include <cstddef>
#include <cstdint>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>
#include <vector>

namespace HostFlow
{

/// A hash of a name's text.
std::uint64_t HashOfName( std::string_view i_Name );

/// A name that items have; all items that have it share it.
struct VName
{
  std::string Text;
  std::uint64_t Hash = 0;
  std::uint32_t Number = 0; ///< no other text has had it; 0 when the numbers have run out
  std::atomic< std::int32_t > Uses{ 0 };
};

/// The names of all items. A name that nobody uses stays for the next item that has it, until the book is trimmed or
/// would have to grow; so a frame of known names allocates nothing. Thread: any.
class VNameBook
{
public:
  static VNameBook& Instance();

  /// The name, used once more. It lives until it is given back as often as it was taken.
  VName& Take( std::string_view i_Text );
  static void GiveBack( VName& i_rName ) { i_rName.Uses.fetch_sub( 1, std::memory_order_release ); }
  /// Forgets the names that nobody uses.
  void Trim();
  std::size_t Count() const;

private:
  VName*& Find( std::uint64_t i_Hash, std::string_view i_Text );
  void DropUnused();
  void Rehash( std::size_t i_Places );

  mutable std::mutex m_Guard;
  std::vector< std::unique_ptr< VName > > m_Names;
  std::vector< VName* > m_Places; ///< by hash, open addressing; a power of two, at most half full
  std::uint32_t m_LastNumber = 0;
};

} // namespace HostFlow
