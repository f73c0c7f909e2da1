#include <HostServices/VSelectionService.h>

#include <TestSupport/Calls.h>

#include <gtest/gtest.h>

#include <array>
#include <thread>

using HostServices::VSelectionService;
using ZEK::VSelection;
using ZEK::VSelectionItem;
constexpr auto Primary = ZEK::ISelectionService::EPrimary;
constexpr auto Secondary = ZEK::ISelectionService::ESecondary;

namespace
{
VSelectionItem Item( std::uint32_t i_Kind, const std::string& i_rDevice, std::uint32_t i_Sub = 0 )
{
  return { .Kind = i_Kind, .Device = i_rDevice, .Sub = i_Sub };
}
} // namespace

TEST( SelectionService, SignalsOnceADistinctChangeOfItsKinds )
{
  VSelectionService Service;
  TestSupport::VCalls Cameras( *Service.ForKinds( { ZEK::ESelectDevice } ) );
  TestSupport::VCalls Both( *Service.ForKinds( { ZEK::ESelectMarker, ZEK::ESelectDevice, ZEK::ESelectMarker } ) );
  TestSupport::VCalls Points( *Service.ForKinds( { ZEK::ESelectReconstruction } ) );
  TestSupport::VCalls All( *Service.ForKinds( {} ) );
  const VSelectionItem A = Item( ZEK::ESelectDevice, "A" );
  const VSelectionItem B = Item( ZEK::ESelectDevice, "B" );
  const VSelectionItem M = Item( ZEK::ESelectMarker, "S:M" );

  const VSelectionItem P = Item( ZEK::ESelectReconstruction, "", 4 );
  const VSelectionItem Q = Item( ZEK::ESelectReconstruction, "", 5 );
  struct VStep
  {
    ZEK::ISelectionService::ESet Set;
    VSelection Items;
    std::array< int, 4 > Calls; ///< of Cameras, Both, Points, All
    const char* pWhat;
  };
  for ( const VStep& rStep : { VStep{ Primary, { A, B }, { 1, 1, 0, 1 }, "two items at once are one change" },
                               { Primary, { A, B }, { 0, 0, 0, 0 }, "an equal set" },
                               { Primary, { A, B, M }, { 0, 1, 0, 1 }, "an item of another kind comes" },
                               { Primary, { A, M }, { 1, 1, 0, 1 }, "one goes" },
                               { Secondary, { A }, { 1, 1, 0, 1 }, "the other set" },
                               { Primary, { M, A }, { 0, 1, 0, 1 }, "another order, hence another current item" },
                               { Primary, {}, { 1, 1, 0, 1 }, "cleared" },
                               { Primary, { P }, { 0, 0, 1, 1 }, "a point" },
                               { Primary, { Q }, { 0, 0, 1, 1 }, "another point of the same set" } } )
  {
    Service.Set( rStep.Set, rStep.Items );
    EXPECT_EQ( ( std::array{ Cameras.Take(), Both.Take(), Points.Take(), All.Take() } ), rStep.Calls ) << rStep.pWhat;
  }
}

TEST( SelectionService, KeepsWhatIsSelectedWithoutDoublesAndTheLastAddedCurrent )
{
  VSelectionService Service;
  const VSelectionItem A = Item( ZEK::ESelectDevice, "A" );
  const VSelectionItem B = Item( ZEK::ESelectCentroid, "A", 7 );
  const auto Before = Service.Generation();
  Service.Set( Primary, { A, B, VSelectionItem{}, A } );
  EXPECT_EQ( Service.Get( Primary ), ( VSelection{ B, A } ) );
  EXPECT_EQ( Service.CurrentItem(), A );
  EXPECT_GT( Service.Generation(), Before );
  VSelection Found{ B };
  EXPECT_TRUE( Service.Get( Primary, { ZEK::ESelectSubject, ZEK::ESelectDevice }, Found ) );
  EXPECT_EQ( Found, ( VSelection{ A } ) );
  EXPECT_FALSE( Service.Get( Primary, { ZEK::ESelectSubject }, Found ) );
  EXPECT_TRUE( Found.empty() );
  EXPECT_FALSE( Service.Get( Secondary, {}, Found ) );
  Service.SetOnly( Primary, {} );
  EXPECT_EQ( Service.CurrentItem().Kind, ZEK::ESelectNone );
}

TEST( SelectionService, AHandlerMayChangeTheSelectionItself )
{
  VSelectionService Service;
  int Count = 0;
  const auto Connection = Service.ForKinds( { ZEK::ESelectDevice } )
                              ->Connect(
                                  [&]
                                  {
                                    ++Count;
                                    Service.Set( Secondary, Service.Get( Primary ) );
                                  },
                                  nullptr );
  Service.SetOnly( Primary, Item( ZEK::ESelectDevice, "A" ) );
  EXPECT_EQ( Count, 2 );
  EXPECT_EQ( Service.Get( Secondary ), Service.Get( Primary ) );
}

TEST( SelectionService, TextsNameTheirItem )
{
  const VSelectionService Service;
  EXPECT_EQ( Service.Text( Item( ZEK::ESelectDevice, "cam 12/top" ) ), "cam 12/top" );
  EXPECT_EQ( Service.FromName( "cam 12/top" ), Item( ZEK::ESelectDevice, "cam 12/top" ) );
  EXPECT_EQ( Service.Text( { ZEK::ESelectMarker, "Walker:LFHD", 1, 4 } ), "@marker/1/4/Walker:LFHD" );

  using namespace std::string_literals;
  const std::vector< std::string > Names{ "",        "plain",     "with space", "a/b/c", "@", "@device/0/0/x", "50%",
                                          "«ü»\n\t", "zero\0in"s, "/",          "#1",    ":", "@marker/1/2/y" };
  constexpr std::uint32_t Kinds[] = { 1, 2, 3, 5, 6, 7, 8, 9, 10, 11, 12, 27, 30, 33, 77, 0xffffffffu };
  for ( const std::uint32_t Kind : Kinds )
  {
    for ( const std::string& rName : Names )
    {
      for ( const auto& [Object, Sub] : { std::pair{ 0ull, 0u }, { ~0ull, 5u }, { 12ull, ~0u } } )
      {
        const VSelectionItem Original{ Kind, rName, Object, Sub };
        EXPECT_EQ( Service.FromName( Service.Text( Original ) ), Original ) << Service.Text( Original );
      }
    }
  }
}

TEST( SelectionService, BadTextsNameNothing )
{
  const VSelectionService Service;
  EXPECT_TRUE( Service.Text( {} ).empty() );
  for ( const char* pText : { "", "@", "@marker", "@marker/1/2", "@nothing/1/2/a", "@marker/x/2/a", "@marker/1/-2/a",
                              "@marker/1/4294967296/a", "@marker/ 1/2/a", "@marker//2/a", "@0/1/2/a", "@/1/2/a",
                              "@marker/99999999999999999999/2/a" } )
  {
    EXPECT_EQ( Service.FromName( pText ), VSelectionItem{} ) << pText;
  }
}

TEST( SelectionService, OnlyTheFourKindsTakeASubIndex )
{
  using FSetter = bool ( * )( VSelectionItem&, std::uint32_t );
  const std::pair< std::uint32_t, FSetter > Setters[] = { { 3, &HostServices::SetCentroidIndex },
                                                          { 30, &HostServices::SetMaskCellIndex },
                                                          { 5, &HostServices::SetReconstructionIndex },
                                                          { 2, &HostServices::SetGreyscaleBlobIndex } };
  for ( std::uint32_t Kind = 0; Kind < 40; ++Kind )
  {
    bool bAny = false;
    for ( const auto& [Own, pSetter] : Setters )
    {
      VSelectionItem Each = Item( Kind, "d", 3 );
      EXPECT_EQ( pSetter( Each, 9 ), Kind == Own );
      EXPECT_EQ( Each.Sub, Kind == Own ? 9u : 3u );
      bAny = bAny || Kind == Own;
    }
    VSelectionItem Any = Item( Kind, "d", 3 );
    EXPECT_EQ( HostServices::SetSubIndex( Any, 9 ), bAny );
  }
}

TEST( SelectionService, IsReadByOtherThreadsWhileItChanges )
{
  VSelectionService Service;
  std::atomic< bool > bStop = false;
  std::atomic< bool > bTorn = false;
  std::thread Reader(
      [&]
      {
        std::uint64_t Last = 0;
        while ( !bStop )
        {
          const std::uint64_t Now = Service.Generation();
          const VSelection Seen = Service.Get( Primary );
          // The writer sets pairs of equal devices only.
          bTorn = bTorn || Now < Last || Seen.size() % 2 != 0 || ( !Seen.empty() && Seen[0].Device != Seen[1].Device );
          Last = Now;
        }
      } );
  for ( int Round = 0; Round < 2000; ++Round )
  {
    const std::string Name = std::to_string( Round );
    Service.Set( Primary, { Item( ZEK::ESelectDevice, Name ), Item( ZEK::ESelectCentroid, Name ) } );
  }
  bStop = true;
  Reader.join();
  EXPECT_FALSE( bTorn );
}
