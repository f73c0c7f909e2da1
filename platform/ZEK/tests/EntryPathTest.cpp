#include <ZEK/EntryPath.h>

#include <gtest/gtest.h>

#include <set>

using ZEK::VEntryPath;

TEST( VEntryPath, TheHashOfATextIsTheSameEverywhere )
{
  const std::pair< const char*, std::uint64_t > Rows[] = { { "", 0 },
                                                           { "a", 0x3d38188654ef1dbf },
                                                           { "A", 0x7887670f6731e86c },
                                                           { "a/b", 0x8613e65f026c86d3 },
                                                           { "Core", 0xb95c475cafa00974 },
                                                           { "*", 0xe4f54d2546609b38 },
                                                           { "Preferences/SubjectViewPresets", 0x6ff83cbcd4f20e9e },
                                                           { "\xc3\xa9", 0xfc1b9406b76789f8 } };
  for ( const auto& [pText, Hash] : Rows )
  {
    EXPECT_EQ( VEntryPath( pText ).Hash(), Hash ) << pText;
  }
}

TEST( VEntryPath, PartsOfAPath )
{
  constexpr std::uint64_t None = VEntryPath::NoWildcard;
  struct VRow
  {
    const char* pText;
    const char* pParent;
    const char* pLeaf;
    std::uint64_t LeafPosition;
    std::uint64_t Wildcard;
    std::uint64_t ParentWildcard;
  };
  const VRow Rows[] = {
      { "", "", "", 0, None, None },     { "a", "", "a", 0, None, None },          { "a/b", "a", "b", 2, None, None },
      { "a/", "a", "", 2, None, None },  { "/a", "", "a", 1, None, None },         { "/", "", "", 1, None, None },
      { "//", "/", "", 2, None, None },  { "a/b/cd", "a/b", "cd", 4, None, None }, { "a*/b", "a*", "b", 3, 1, 1 },
      { "*/b", "*", "b", 2, 0, 0 },      { "a/*", "a", "*", 2, 2, None },          { "*", "", "*", 0, 0, None },
      { "a/b*/*", "a/b*", "*", 5, 3, 3 } };
  for ( const VRow& rRow : Rows )
  {
    SCOPED_TRACE( rRow.pText );
    const VEntryPath Path( rRow.pText );
    EXPECT_EQ( Path.LeafPosition(), rRow.LeafPosition );
    EXPECT_EQ( Path.Leaf(), rRow.pLeaf );
    EXPECT_EQ( Path.WildcardPosition(), rRow.Wildcard );
    const VEntryPath Parent = Path.Parent();
    EXPECT_EQ( Parent, VEntryPath( rRow.pParent ) );
    EXPECT_EQ( Parent.WildcardPosition(), rRow.ParentWildcard );
    EXPECT_EQ( Parent.LeafPosition(), VEntryPath( rRow.pParent ).LeafPosition() );
  }
}

TEST( VEntryPath, AChildIsThePathOfItsText )
{
  for ( const char* pParent : { "", "a", "a/b", "*", "/" } )
  {
    for ( const char* pName : { "", "x", "*", "long name of a child", "y/z", "\xff" } )
    {
      const VEntryPath Parent( pParent );
      const VEntryPath Whole( Parent.IsRoot() ? std::string( pName ) : std::string( pParent ) + '/' + pName );
      VEntryPath Child( "something else*" );
      Child.AssignChild( Parent, pName );
      VEntryPath Grown = Parent;
      Grown.AssignChild( Grown, pName );
      for ( const VEntryPath& rMade : { Child, Grown } )
      {
        EXPECT_EQ( rMade, Whole ) << Whole.Text();
        EXPECT_EQ( rMade.Hash(), Whole.Hash() ) << Whole.Text();
        EXPECT_EQ( rMade.LeafPosition(), Whole.LeafPosition() ) << Whole.Text();
        EXPECT_EQ( rMade.WildcardPosition(), Whole.WildcardPosition() ) << Whole.Text();
      }
    }
  }
}

TEST( VEntryPatternSet, IsOrderedByHandlesThenByPathBytes )
{
  auto* const pLow = reinterpret_cast< Store::VStoreEntry* >( std::uintptr_t{ 0x1000 } );
  auto* const pHigh = reinterpret_cast< Store::VStoreEntry* >( std::uintptr_t{ 0x2000 } );
  const ZEK::VEntryPatternSet Ordered[] = { {},
                                            { {}, { "a" } },
                                            { {}, { "a", "b" } },
                                            { {}, { "b", "a" } },
                                            { {}, { "\xc3\xa9" } },
                                            { { pLow }, {} },
                                            { { pLow }, { "a" } },
                                            { { pLow, pHigh }, {} },
                                            { { pHigh }, {} },
                                            { { pHigh, pLow }, {} } };
  for ( const auto& rA : Ordered )
  {
    for ( const auto& rB : Ordered )
    {
      EXPECT_EQ( rA < rB, &rA < &rB );
      EXPECT_EQ( rA == rB, &rA == &rB );
    }
  }
}
