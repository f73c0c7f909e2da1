#include <Flow2TypesUtils/ParameterSet.h>

#include <CoreMoxelTypes/FlowTypes.h>
#include <HostFlow/VFlowFramework.h>

#include <gtest/gtest.h>

#include <limits>

using namespace CoreMoxelTypes;

namespace
{
ZEK::VFlowItemRef ItemOf( const std::map< std::string, VVariant >& i_rValues, const std::string& i_rTarget = "A" )
{
  ZEK::IResult Status;
  ZEK::VFlowItemRef Item;
  HostFlow::MakeItemStore()->CreateItem( Status, ZEK::FlowValueType< FlowParametersItem >::Descriptor, Item );
  *ZEK::FlowMutablePayload< VParametersItem >( Item.Get() ) = { i_rTarget, i_rValues };
  Item->MutableValue().SetName( ZEK::EFlowNameTarget, i_rTarget );
  return Item;
}
constexpr const char* Names[] = { "Low", "High" };
} // namespace

TEST( ParameterSet, TakesAllParametersOrNone )
{
  Flow2Utils::VParameterSet Set( Names );
  EXPECT_EQ( Set.Read( ItemOf( { { "Low", 1.5 }, { "High", std::int64_t{ 7 } }, { "More", true } } ).Get() ),
             ZEK::IResult( ZEK::IResult::Ok ) );
  const auto Held = []( const Flow2Utils::VParameterSet& i_rSet )
  {
    return std::vector< float >( i_rSet.Values().begin(), i_rSet.Values().end() );
  };
  EXPECT_EQ( Held( Set ), ( std::vector< float >{ 1.5F, 7.0F } ) );
  const std::map< std::string, VVariant > Bad[] = {
      { { "Low", 3.0 } },
      { { "Low", 3.0 }, { "High", std::string( "4" ) } },
      { { "Low", 3.0 }, { "High", true } },
      { { "Low", 3.0 }, { "High", std::numeric_limits< double >::quiet_NaN() } },
      { { "Low", 3.0 }, { "High", 1e300 } },
  };
  for ( const auto& rValues : Bad )
  {
    EXPECT_TRUE( Set.Read( ItemOf( rValues ).Get() ).IsError() );
    EXPECT_EQ( Held( Set ), ( std::vector< float >{ 1.5F, 7.0F } ) );
  }
  EXPECT_TRUE( Set.Read( nullptr ).IsError() );
}

TEST( ParameterSet, AnItemIsFoundByItsTargetAmongOthers )
{
  ZEK::VFlowStateRef State;
  ASSERT_TRUE( HostFlow::MakeStateFactory()->CreateState( State, { 10, 1, 1 }, {}, {} ).IsOk() );
  const auto Wanted = ItemOf( {}, "B" ), Late = ItemOf( {}, "C" );
  State->AddItem( ItemOf( {}, "A" ) );
  State->AddItemAt( Wanted, { 0, 100, 1 } );
  State->AddItemAt( Late, { 50, 100, 1 } );
  EXPECT_EQ( Flow2Utils::FindParameters( *State, "B" ), Wanted.Get() );
  EXPECT_EQ( Flow2Utils::FindParameters( *State, "C" ), nullptr ) << "it holds for another time";
  EXPECT_EQ( Flow2Utils::FindParameters( *State, "" ), nullptr );
}
