#include "StoreIoFixture.h"

#include <RandomValues.h>
#include <StoreIO/CheckDocument.h>

#include <iterator>
#include <map>

using namespace ZEK;

namespace StoreIO
{
namespace
{
/// What a document carries of an entry.
struct VCarried
{
  VTypedValue m_Verified;
  VTypedValue m_Proposed;
  friend bool operator==( const VCarried&, const VCarried& ) = default;
};
using VCarriedEntries = std::map< std::string, VCarried >;

std::string Name( VRandomValues& io_rRandom )
{
  static const std::string s_Names[] = {
      "*",        "a*b",        "", "Value", "Children", "Type", "\xe6\xb8\xac\xe5\xae\x9a", "\xf0\x9f\x8e\xa5 \"cam\"",
      "\xff\xfe", "back\\slash" };
  std::string Made =
      io_rRandom.Below( 3 ) == 0 ? s_Names[io_rRandom.Below( std::size( s_Names ) )] : io_rRandom.Text( 20 );
  for ( char& rLetter : Made )
  {
    rLetter = rLetter == '/' ? '_' : rLetter;
  }
  return Made;
}

/// Fills a store, and says what it must say afterwards.
VCarriedEntries Fill( const VSettings& i_rSettings, std::uint64_t i_Seed, int i_Count )
{
  VRandomValues Random( i_Seed );
  VCarriedEntries Entries;
  std::vector< std::string > Paths{ "" };
  i_rSettings.Write(
      [&]( IStoreWriter& io_rWriter )
      {
        for ( int Count = 0; Count < i_Count; ++Count )
        {
          const std::string& rParent = Paths[Random.Below( Paths.size() )];
          // A path cannot begin with a '/' and come back.
          std::string Path = std::string( rParent ).append( rParent.empty() ? "r" : "/" ).append( Name( Random ) );
          const IO::ISchema* const pSchema = Random.Schema( 3 );
          if ( Entries.contains( Path ) || pSchema == nullptr )
          {
            continue;
          }
          VCarried Carried{ Random.Value( pSchema ), {} };
          if ( Random.Below( 4 ) == 0 )
          {
            Carried.m_Proposed = Random.Value( pSchema );
            Carried.m_Verified = Random.Below( 2 ) == 0 ? VTypedValue() : Carried.m_Verified;
            io_rWriter.SetFlag( i_rSettings[Path], EVerifyRequired );
            EXPECT_EQ( io_rWriter.SetProposedValue( i_rSettings[Path], Carried.m_Proposed ), IResult::Ok );
          }
          if ( !Carried.m_Verified.IsEmpty() )
          {
            EXPECT_EQ( io_rWriter.SetVerifiedValue( i_rSettings[Path], Carried.m_Verified ), IResult::Ok );
          }
          Entries.emplace( Path, Carried );
          Paths.push_back( std::move( Path ) );
        }
      } );
  return Entries;
}

VCarriedEntries Carried( const VSettings& i_rSettings )
{
  VCarriedEntries Entries;
  i_rSettings.Read(
      [&]( IStoreReader& i_rReader )
      {
        std::vector< ::Store::VStoreEntry* > Left = i_rReader.Children( i_rSettings.m_pStore->GetRootEntry() );
        while ( !Left.empty() )
        {
          ::Store::VStoreEntry* const pEntry = Left.back();
          Left.pop_back();
          const auto Children = i_rReader.Children( pEntry );
          Left.insert( Left.end(), Children.begin(), Children.end() );
          const VCarried Found{ i_rReader.VerifiedValue( pEntry ), i_rReader.ProposedValue( pEntry ) };
          EXPECT_EQ( ( i_rReader.Flags( pEntry ) & EVerifyRequired ) != 0, !Found.m_Proposed.IsEmpty() );
          Entries.emplace( i_rSettings.m_pStore->EntryPath( pEntry ).Text(), Found );
        }
      } );
  return Entries;
}

TEST( RoundTrip, RandomStores )
{
  for ( std::uint64_t Seed = 0; Seed < 60; ++Seed )
  {
    SCOPED_TRACE( Seed );
    const VSettings Settings;
    const VCarriedEntries Entries = Fill( Settings, Seed, 60 );
    const std::string Text = Settings.Text();
    const VSettings Back;
    ASSERT_EQ( Back.Import( Text ), IResult::Ok );
    ASSERT_EQ( Carried( Back ), Entries );
    ASSERT_EQ( Back.Text(), Text );
    // Over what is there, in a store that has other values of the same types and more entries.
    VRandomValues Random( Seed + 1000 );
    Back.Write(
        [&]( IStoreWriter& io_rWriter )
        {
          for ( const auto& [rPath, rCarried] : Entries )
          {
            const auto* const pSchema =
                ( rCarried.m_Verified.IsEmpty() ? rCarried.m_Proposed : rCarried.m_Verified ).Schema();
            (void)( rCarried.m_Verified.IsEmpty()
                        ? io_rWriter.SetProposedValue( Back[rPath], Random.Value( pSchema ) )
                        : io_rWriter.SetVerifiedValue( Back[rPath], Random.Value( pSchema ) ) );
            (void)io_rWriter.SetVerifiedValue( Back[rPath + "0 more"], IO::MakeValue( 1 ) );
          }
        } );
    ASSERT_EQ( Back.Import( Text ), IResult::Ok );
    VCarriedEntries Now = Carried( Back );
    std::erase_if( Now,
                   []( const auto& i_rEntry )
                   {
                     return i_rEntry.first.ends_with( "0 more" );
                   } );
    ASSERT_EQ( Now, Entries );
    std::vector< std::string > Errors;
    ASSERT_EQ( CheckDocument( Text, Errors ), IResult::Ok ) << Errors.front();
  }
}

TEST( RoundTrip, TextCutAnywhereIsRefusedAndWritesNothing )
{
  const VSettings Settings;
  Fill( Settings, 7, 12 );
  const std::string Text = Settings.Text();
  const VSettings Empty;
  for ( std::size_t Size = 0; Size < Text.size(); ++Size )
  {
    ASSERT_EQ( Empty.Import( std::string_view( Text ).substr( 0, Size ) ), IResult::InvalidFormat ) << Size;
  }
  EXPECT_TRUE( Carried( Empty ).empty() );
}
} // namespace
} // namespace StoreIO
