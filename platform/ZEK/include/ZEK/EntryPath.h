#pragma once

#include <ZEK/Export.h>

#include <compare>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

namespace Store
{
class VStoreEntry;
}

namespace ZEK
{

/// The path of an entry: components separated by `/`; the root is the empty text. A component that is exactly `*`
/// stands for every name of its level. No text is refused: components may be empty and hold any bytes.
///
/// The hash is computed when the text is set, so that a path that is read by several threads is never written.
class VEntryPath
{
public:
  static constexpr std::uint64_t NoWildcard = ~std::uint64_t( 0 );

  VEntryPath() = default;
  ZEK_API VEntryPath( std::string i_Text );
  VEntryPath( const char* i_pText )
    : VEntryPath( std::string( i_pText ) )
  {
  }

  const std::string& Text() const { return m_Text; }
  /// The index of the first `*` anywhere in the text, also inside a name; `NoWildcard` without one.
  std::uint64_t WildcardPosition() const { return m_Wildcard; }
  bool HasWildcard() const { return m_Wildcard != NoWildcard; }
  /// The index of the first character of the last component; 0 for a single component.
  std::uint64_t LeafPosition() const { return m_Leaf; }
  std::uint64_t Hash() const { return m_Hash; }
  bool IsRoot() const { return m_Text.empty(); }

  /// The path without its last component; the root for a single component and for the root itself.
  ZEK_API VEntryPath Parent() const;
  std::string Leaf() const { return std::string( LeafView() ); }
  /// Valid as long as the path is.
  std::string_view LeafView() const { return std::string_view( m_Text ).substr( m_Leaf ); }

  /// Makes this the path of the child `i_Name` of `i_rParent`, which may be this path: a `/` stands between them
  /// unless the parent is the root. Hashes the added bytes only and keeps the text's memory. The name may not lie in
  /// this path.
  ZEK_API void AssignChild( const VEntryPath& i_rParent, std::string_view i_Name );

  friend bool operator==( const VEntryPath& i_rA, const VEntryPath& i_rB )
  {
    return i_rA.m_Hash == i_rB.m_Hash && i_rA.m_Text == i_rB.m_Text;
  }
  /// Byte-wise by text.
  friend std::strong_ordering operator<=>( const VEntryPath& i_rA, const VEntryPath& i_rB )
  {
    return i_rA.m_Text <=> i_rB.m_Text;
  }

private:
  std::string m_Text;
  std::uint64_t m_Wildcard = NoWildcard;
  std::uint64_t m_Leaf = 0;
  std::uint64_t m_Hash = 0;
};

/// Continues the hash of path texts over further bytes; the hash of the empty text is 0. The hash of a text is
/// therefore that of its last part, continued from the hash of its first.
constexpr std::uint64_t HashPathBytes( std::string_view i_Bytes, std::uint64_t i_Hash = 0 )
{
  constexpr std::uint64_t Factor = 0xc6a4a7935bd1e995;
  for ( const char Byte : i_Bytes )
  {
    // Bytes count as signed on every platform.
    std::uint64_t Key = static_cast< std::uint64_t >( static_cast< signed char >( Byte ) ) * Factor;
    Key ^= Key >> 47;
    Key *= Factor;
    i_Hash ^= Key;
    i_Hash *= Factor;
    i_Hash += 0xe6546b64;
  }
  return i_Hash;
}

/// What a handler listens to: entries by handle, and paths, which may hold `*`. Sets with the same members in
/// another order are different sets.
struct VEntryPatternSet
{
  std::vector< ::Store::VStoreEntry* > m_Handles;
  std::vector< VEntryPath > m_Paths;

  /// By the handles as pointers, then by the path texts, each lexicographically.
  ZEK_API friend bool operator<( const VEntryPatternSet& i_rA, const VEntryPatternSet& i_rB );
  friend bool operator==( const VEntryPatternSet& i_rA, const VEntryPatternSet& i_rB ) = default;
};

} // namespace ZEK
