#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>

#include <HostFlow/VFlowFramework.h>

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <random>
#include <set>

using namespace CoreMoxelTypes;
using namespace Flow2TypesUtils;
using ZEK::EFlowTimeMatch;

namespace
{
constexpr std::uint32_t Tags[] = { 0x1000, 0x1001, 0x1023, 0x1025 };

/// An item of another make, which numbers no name.
class VOtherItem final : public ZEK::IFlowItem, public ZEK::IFlowValue
{
public:
  VOtherItem( std::uint32_t i_Tag, const std::string& i_rName )
    : m_Name( i_rName )
  {
    static std::int64_t Number = 0;
    m_Id = { 0, i_Tag, ++Number };
    SetValue( *this );
  }
  bool GetName( std::uint32_t i_Selector, std::string_view& o_rName ) const override
  {
    o_rName = m_Name;
    return i_Selector == ZEK::EFlowNameDevice && !m_Name.empty();
  }
  void SetName( std::uint32_t, std::string_view i_Name ) override { m_Name = i_Name; }
  const void* Payload() const override { return &m_Payload; }
  void* MutablePayload() override { return &m_Payload; }
  const std::type_info& PayloadType() const override { return typeid( VDevice ); }

private:
  void Destroy() override { delete this; }

  std::string m_Name;
  VDevice m_Payload;
};

class VMaker
{
public:
  ZEK::VFlowStateRef State( const ZEK::VFlowTimeKey& i_rKey = { 100, 10, 1 } )
  {
    ZEK::VFlowStateRef Made;
    EXPECT_TRUE( m_Factory->CreateState( Made, i_rKey, {}, {} ).IsOk() );
    return Made;
  }
  ZEK::VFlowItemRef Item( std::uint32_t i_Tag, const std::string& i_rName, bool i_bOther = false )
  {
    if ( i_bOther )
    {
      return ZEK::VFlowItemRef( new VOtherItem( i_Tag, i_rName ) );
    }
    const ZEK::VFlowItemType& rType = i_Tag == Tags[0]   ? ZEK::FlowValueType< FlowCameraHardware >::Descriptor
                                      : i_Tag == Tags[1] ? ZEK::FlowValueType< FlowCameraSettings >::Descriptor
                                      : i_Tag == Tags[2] ? ZEK::FlowValueType< FlowDevice >::Descriptor
                                                         : ZEK::FlowValueType< FlowDeviceSamples >::Descriptor;
    ZEK::IResult Status;
    ZEK::VFlowItemRef Made;
    m_Store->CreateItem( Status, rType, Made );
    if ( !i_rName.empty() )
    {
      Made->MutableValue().SetName( ZEK::EFlowNameDevice, i_rName );
    }
    return Made;
  }

private:
  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
};

/// The join as an ordered map makes it, from nothing in every update.
struct VModel
{
  struct VColumn
  {
    ETagRequirement Requirement;
    std::vector< const ZEK::IFlowItem* > Hits;
    std::vector< ZEK::VFlowValueId > Ids, PreviousIds;
  };
  std::map< std::uint32_t, VColumn > Columns;
  std::vector< std::string > Names, PreviousNames;

  bool Update( const ZEK::IFlowState& i_rState, EFlowTimeMatch i_Match, const ZEK::VFlowTimeKey& i_rKey )
  {
    PreviousNames = Names;
    Names.clear();
    std::map< std::string, std::pair< std::size_t, std::map< std::uint32_t, const ZEK::IFlowItem* > > > Join;
    std::size_t Needed = Columns.size();
    bool bAbort = false;
    for ( auto& [Tag, rColumn] : Columns )
    {
      rColumn.PreviousIds = rColumn.Ids;
      rColumn.Ids.clear();
      rColumn.Hits.clear();
    }
    for ( auto& [Tag, rColumn] : Columns )
    {
      bool bAny = false;
      ZEK::VFlowCursor It, End;
      i_rState.ItemsBegin( It, Tag, i_Match, i_rKey );
      i_rState.ItemsEnd( End, Tag, i_Match, i_rKey );
      for ( ; !bAbort && It != End; ++It )
      {
        std::string_view Name;
        if ( FlowTimeMatches( i_Match, It->Key, i_rKey ) && It->pItem->Value().GetName( ZEK::EFlowNameDevice, Name ) )
        {
          auto& [Count, rItems] = Join[std::string( Name )];
          if ( rItems.emplace( Tag, It->pItem ).second )
          {
            Count += rColumn.Requirement != ETagRequirement::Optional ? 1 : 0;
            bAny = true;
          }
        }
      }
      bAbort = bAbort || ( !bAny && rColumn.Requirement == ETagRequirement::Required );
      Needed -= rColumn.Requirement == ETagRequirement::Optional ||
                        ( !bAny && rColumn.Requirement == ETagRequirement::RequiredIfAny )
                    ? 1
                    : 0;
      rColumn.Hits.assign( bAny || rColumn.Requirement == ETagRequirement::Optional ? 1 : 0, nullptr );
    }
    for ( const auto& [Name, rRow] : Join )
    {
      if ( !bAbort && rRow.first == Needed )
      {
        Names.push_back( Name );
      }
    }
    for ( auto& [Tag, rColumn] : Columns )
    {
      const bool bLeftOut = rColumn.Hits.empty();
      rColumn.Hits.clear();
      for ( std::size_t Index = 0; !bLeftOut && Index < Names.size(); ++Index )
      {
        const auto& rItems = Join[Names[Index]].second;
        const auto Found = rItems.find( Tag );
        rColumn.Hits.push_back( Found == rItems.end() ? nullptr : Found->second );
        rColumn.Ids.push_back( Found == rItems.end() ? ZEK::VFlowValueId{} : Found->second->Id() );
      }
    }
    return !Names.empty();
  }
};

template < typename TFlow >
void ExpectColumn( const VTaggedCoreTypeExtractor& i_rExtractor, const VModel::VColumn& i_rColumn,
                   const ZEK::IFlowState& i_rState )
{
  using TCore = typename ZEK::FlowValueType< TFlow >::type;
  constexpr std::uint32_t Tag = ZEK::FlowTag< TFlow >;
  std::vector< ZEK::VFlowItemRef > Items;
  i_rExtractor.Items< TFlow >( Items );
  const auto& rValues = i_rExtractor.Values< TFlow >();
  ASSERT_EQ( Items.size(), i_rColumn.Hits.size() );
  ASSERT_EQ( rValues.size(), i_rColumn.Hits.size() );
  ASSERT_EQ( i_rExtractor.Entries( Tag ).size(), i_rColumn.Hits.size() );
  ZEK::VFlowCursor End;
  i_rState.EndCursor( End );
  std::vector< bool > Bits;
  i_rExtractor.ChangedBits( Tag, Bits );
  ASSERT_EQ( Bits.size(), i_rColumn.Ids.size() );
  for ( std::size_t Slot = 0; Slot < Items.size(); ++Slot )
  {
    EXPECT_EQ( Items[Slot].Get(), i_rColumn.Hits[Slot] );
    EXPECT_EQ( rValues[Slot], ZEK::FlowPayload< TCore >( i_rColumn.Hits[Slot] ) );
    EXPECT_EQ( i_rExtractor.Entries( Tag )[Slot] == End, i_rColumn.Hits[Slot] == nullptr );
    const auto& rPrevious = i_rColumn.PreviousIds;
    EXPECT_EQ( Bits[Slot], std::find( rPrevious.begin(), rPrevious.end(), i_rColumn.Ids[Slot] ) == rPrevious.end() );
  }
  EXPECT_EQ( i_rExtractor.Changed( Tag ), i_rColumn.Ids != i_rColumn.PreviousIds );
}

void ExpectAlike( const VTaggedCoreTypeExtractor& i_rExtractor, const VModel& i_rModel,
                  const ZEK::IFlowState& i_rState )
{
  EXPECT_EQ( i_rExtractor.Names(), i_rModel.Names );
  EXPECT_EQ( i_rExtractor.NamesChanged(), i_rModel.Names != i_rModel.PreviousNames );
  for ( std::size_t Index = 0; Index < i_rModel.Names.size(); ++Index )
  {
    std::uint64_t Slot = 0;
    EXPECT_TRUE( i_rExtractor.IndexOf( i_rModel.Names[Index], Slot ) );
    EXPECT_EQ( Slot, Index );
  }
  ExpectColumn< FlowCameraHardware >( i_rExtractor, i_rModel.Columns.at( Tags[0] ), i_rState );
  ExpectColumn< FlowCameraSettings >( i_rExtractor, i_rModel.Columns.at( Tags[1] ), i_rState );
  ExpectColumn< FlowDevice >( i_rExtractor, i_rModel.Columns.at( Tags[2] ), i_rState );
  ExpectColumn< FlowDeviceSamples >( i_rExtractor, i_rModel.Columns.at( Tags[3] ), i_rState );
}
} // namespace

// Objects come and go, values change, items repeat a name, lose it or hold for another time, tags vanish; and most
// updates change little, so that joins are kept in between.
TEST( TaggedCoreTypeExtractor, JoinsAsAnOrderedMapWouldWhateverWasBefore )
{
  VMaker Maker;
  for ( std::uint32_t Seed = 0; Seed < 27; ++Seed )
  {
    std::mt19937 Random( Seed );
    const auto Below = [&]( std::uint32_t i_Limit )
    {
      return static_cast< std::uint32_t >( Random() % i_Limit );
    };
    const auto Requirement = [&]( std::uint32_t i_Place )
    {
      constexpr std::uint32_t Powers[] = { 1, 3, 9 };
      return static_cast< ETagRequirement >( i_Place < 3 ? Seed / Powers[i_Place] % 3 : 2 );
    };
    VTaggedCoreTypeExtractor Extractor;
    Extractor.AddCache< FlowDeviceSamples >( Requirement( 3 ) );
    Extractor.AddCache< FlowDevice >( Requirement( 2 ) );
    Extractor.AddCache< FlowCameraHardware >( Requirement( 0 ) );
    Extractor.AddCache< FlowCameraSettings >( Requirement( 1 ) );
    VModel Model;
    for ( std::uint32_t Place = 0; Place < 4; ++Place )
    {
      Model.Columns[Tags[Place]].Requirement = Requirement( Place );
    }
    struct VEntry
    {
      std::uint32_t Tag;
      ZEK::VFlowItemRef Item;
      ZEK::VFlowTimeKey Key;
    };
    std::vector< VEntry > Entries;
    const auto Entry = [&]( std::uint32_t i_Tag, std::uint32_t i_Name )
    {
      const std::string Name =
          i_Name == 7 ? std::string() : std::string( "a device with a long name " ).append( std::to_string( i_Name ) );
      // A key of its own keeps an item beside one of its name; some lie in the past, some hold long.
      const ZEK::VFlowTimeKey Keys[] = { { 0, 1000, 1 }, { 100, 10, 1 }, { 101, 0, 1 }, { 7, 5, 1 }, { 100, 1, 9 } };
      return VEntry{ i_Tag, Maker.Item( i_Tag, Name, i_Tag == Tags[2] && Below( 3 ) == 0 ), Keys[Below( 8 ) % 5] };
    };
    for ( std::uint32_t Tag : Tags )
    {
      for ( std::uint32_t Name = 0; Name < 8; ++Name )
      {
        Entries.push_back( Entry( Tag, Name ) );
      }
    }
    std::set< bool > Results;
    for ( int Step = 0; Step < 120; ++Step )
    {
      const std::uint32_t Which = Below( static_cast< std::uint32_t >( Entries.size() ) );
      switch ( Below( 9 ) )
      {
      case 4: // the same items in another order
        std::rotate( Entries.begin(), Entries.begin() + Which, Entries.end() );
        break;
      case 0:
        Entries[Which] = Entry( Entries[Which].Tag, Below( 9 ) );
        break;
      case 1:
        Entries.push_back( Entry( Tags[Below( 4 )], Below( 9 ) ) );
        break;
      case 2:
        Entries.erase( Entries.begin() + Which );
        break;
      case 3: // a new value of the same name at the same place
      {
        std::string_view Name;
        Entries[Which].Item->Value().GetName( ZEK::EFlowNameDevice, Name );
        const std::string Kept( Name );
        // When nobody else has the name and it is forgotten, it comes back under another number.
        Entries[Which].Item = nullptr;
        HostFlow::TrimPools();
        Entries[Which].Item = Maker.Item( Entries[Which].Tag, Kept, Entries[Which].Tag == Tags[2] && Below( 2 ) == 0 );
        break;
      }
      default:
        break;
      }
      const std::uint32_t Absent = Below( 12 ); // now and then a tag is not there
      const bool bEmpty = Below( 25 ) == 0;
      // A late state lies before those that came, so that other items hold for it.
      const ZEK::VFlowStateRef State = Maker.State( { Below( 8 ) == 0 ? 8 : 100, 10, 1 } );
      for ( const VEntry& rEntry : Entries )
      {
        if ( !bEmpty && ( Absent > 3 || rEntry.Tag != Tags[Absent] ) )
        {
          State->AddItemAt( rEntry.Item, rEntry.Key );
        }
      }
      const EFlowTimeMatch Match = Below( 10 ) == 0 ? EFlowTimeMatch::BeforeOrAt : EFlowTimeMatch::Overlap;
      const bool bExpected = Model.Update( *State, Match, State->GetKey() );
      Results.insert( bExpected );
      ASSERT_EQ( Extractor.Update( *State, ZEK::EFlowNameDevice, Match, State->GetKey() ), bExpected );
      ExpectAlike( Extractor, Model, *State );
      ASSERT_FALSE( testing::Test::HasFailure() ) << "seed " << Seed << ", step " << Step;
      // The same items under a new state: nothing may seem changed, and nothing may point into the former state.
      const ZEK::VFlowStateRef Again = Maker.State( State->GetKey() );
      Again->Merge( *State );
      Model.Update( *Again, Match, Again->GetKey() );
      Extractor.Update( *Again, ZEK::EFlowNameDevice, Match, Again->GetKey() );
      ExpectAlike( Extractor, Model, *Again );
      EXPECT_FALSE( Extractor.NamesChanged() || Extractor.Changed( Tags[0] ) );
      ASSERT_FALSE( testing::Test::HasFailure() ) << "seed " << Seed << ", step " << Step << ", again";
    }
    EXPECT_TRUE( Results.contains( true ) ) << "seed " << Seed << " joined nothing";
  }
}

// What a consumer is told as the states go by, each beside the one before.
TEST( TaggedCoreTypeExtractor, EachStateIsToldFromTheOneBefore )
{
  VMaker Maker;
  VTaggedCoreTypeExtractor Extractor;
  Extractor.AddCache< FlowCameraHardware >( ETagRequirement::Required );
  Extractor.AddCache< FlowCameraSettings >( ETagRequirement::RequiredIfAny );
  Extractor.AddCache< FlowDevice >( ETagRequirement::Optional );
  using VItems = std::vector< ZEK::VFlowItemRef >;
  ZEK::VFlowStateRef State;
  const auto Show = [&]( const VItems& i_rItems )
  {
    const ZEK::VFlowStateRef Next = Maker.State();
    for ( const ZEK::VFlowItemRef& rItem : i_rItems )
    {
      Next->AddItem( rItem );
    }
    State = Next; // the state before is gone when the extractor meets this one
    return Extractor.Update( *State, ZEK::EFlowNameDevice, EFlowTimeMatch::Overlap, State->GetKey() );
  };
  const auto Told = [&]
  {
    std::vector< bool > Bits;
    Extractor.ChangedBits( Tags[0], Bits );
    std::string Text = Extractor.NamesChanged() ? "names " : "";
    Text += Extractor.Changed( Tags[0] ) ? "changed " : "";
    for ( std::size_t Slot = 0; Slot < Bits.size(); ++Slot )
    {
      Text += Extractor.Names()[Slot] + ( Bits[Slot] ? "* " : " " );
    }
    return Text;
  };
  const ZEK::VFlowItemRef A = Maker.Item( Tags[0], "a" ), B = Maker.Item( Tags[0], "b" ),
                          C = Maker.Item( Tags[0], "c" );
  const ZEK::VFlowItemRef Plain = Maker.Item( Tags[2], "b" );
  EXPECT_TRUE( Show( { A, B, C, Plain } ) );
  EXPECT_EQ( Told(), "names changed a* b* c* " );
  VItems Devices;
  Extractor.Items< FlowDevice >( Devices );
  EXPECT_EQ( Devices, ( VItems{ nullptr, Plain, nullptr } ) );
  Show( { A, B, C, Plain } );
  EXPECT_EQ( Told(), "a b c " );
  Show( { C, A, B } );
  EXPECT_EQ( Told(), "a b c " ) << "another order";
  const ZEK::VFlowItemRef NewB = Maker.Item( Tags[0], "b" );
  Show( { A, NewB, C } );
  EXPECT_EQ( Told(), "changed a b* c " );
  Show( { A, NewB, Maker.Item( Tags[0], "d" ) } );
  State = nullptr;
  HostFlow::TrimPools();
  Show( { A, NewB, Maker.Item( Tags[0], "d" ) } );
  EXPECT_EQ( Told(), "changed a b d* " ) << "a name that was forgotten in between";
  Show( { A, NewB, C } );
  Show( { NewB, C } );
  EXPECT_EQ( Told(), "names changed b c " ) << "moved to other slots";
  Show( { NewB, C, Maker.Item( Tags[1], "c" ) } );
  EXPECT_EQ( Told(), "names changed c " ) << "a tag that is there for one hides the others";
  EXPECT_FALSE( Show( { Maker.Item( Tags[1], "c" ), Plain } ) );
  EXPECT_EQ( Told(), "names changed " ) << "the required tag is gone";
  EXPECT_FALSE( Show( {} ) );
  EXPECT_EQ( Told(), "" );
  EXPECT_TRUE( Show( { A } ) );
  EXPECT_EQ( Told(), "names changed a* " );
  EXPECT_TRUE( Extractor.Values< FlowCameraSettings >().empty() );
  EXPECT_EQ( Extractor.Values< FlowDevice >(), ( std::vector< const VDevice* >{ nullptr } ) );
}

TEST( TaggedCoreTypeExtractor, AnotherSelectorJoinsByOtherNames )
{
  VMaker Maker;
  VTaggedCoreTypeExtractor Extractor;
  Extractor.AddCache< FlowDevice >( ETagRequirement::Required );
  const ZEK::VFlowItemRef Item = Maker.Item( Tags[2], "by device" );
  Item->MutableValue().SetName( ZEK::EFlowNameObject, "by object" );
  const ZEK::VFlowStateRef State = Maker.State();
  State->AddItem( Item );
  EXPECT_TRUE( Extractor.Update( *State, ZEK::EFlowNameDevice, EFlowTimeMatch::Overlap, State->GetKey() ) );
  EXPECT_TRUE( Extractor.Update( *State, ZEK::EFlowNameObject, EFlowTimeMatch::Overlap, State->GetKey() ) );
  EXPECT_EQ( Extractor.Names(), std::vector< std::string >{ "by object" } );
  EXPECT_TRUE( Extractor.NamesChanged() );
  std::uint64_t Slot = 0;
  EXPECT_FALSE( Extractor.IndexOf( "by device", Slot ) );
  EXPECT_EQ( Slot, ~std::uint64_t{ 0 } );
}

TEST( TaggedCoreTypeExtractor, AnAccessorOfAWrongTagOrTypeStopsAtTheAssertion )
{
  std::vector< std::string > Failed;
  const auto Former = DebugServices::SetAssertFailHandler(
      [&]( const char* i_pExpression, const char*, int )
      {
        Failed.emplace_back( i_pExpression );
      } );
  VTaggedCoreTypeExtractor Extractor;
  Extractor.AddCache< FlowDevice >( ETagRequirement::Required );
  EXPECT_TRUE( Extractor.Values< FlowDeviceSamples >().empty() );
  EXPECT_FALSE( Extractor.Changed( 0x9999 ) );
  std::vector< const VDeviceSamples* > Values;
  Extractor.Values( Tags[2], Values );
  DebugServices::SetAssertFailHandler( Former );
  EXPECT_EQ( Failed, ( std::vector< std::string >{
                         "It != m_ItemCacheMap.end()", "It != m_ItemCacheMap.end()",
                         "dynamic_cast< const VItemCacheTyped< TCoreType >* >( It->second.get() )" } ) );
}
