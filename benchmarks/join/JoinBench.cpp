// Joining the items of a frame by object name: 128 cameras by 13 kinds and 50 subjects by 4, through the real extractor
// on real states. same: the next frame has the same items; changed: new items of the same names; renamed: new names.
// The floors join plain structures; `kept` keeps the slots of the frame before, `flat` hashes all names anew.

#include "JoinFloor.h"

#include <Flow2TypesUtils/TaggedCoreTypeExtractor.h>
#include <HostFlow/VFlowFramework.h>

#include <benchmark/benchmark.h>

#include <cstdlib>

using namespace CoreMoxelTypes;
using Flow2TypesUtils::ETagRequirement;
using Flow2TypesUtils::VTaggedCoreTypeExtractor;

namespace
{
enum ECase
{
  ECaseSame,
  ECaseChanged,
  ECaseRenamed
};

template < typename... TFlow >
struct VKinds
{
  static constexpr int Count = sizeof...( TFlow );
  static constexpr std::uint32_t Tags[] = { ZEK::FlowTag< TFlow >... };
  static void AddTo( VTaggedCoreTypeExtractor& io_rJoin )
  {
    ( io_rJoin.AddCache< TFlow >( ETagRequirement::Required ), ... );
  }
  /// The values of every kind and whether they changed, as a consumer asks for them.
  static void Ask( const VTaggedCoreTypeExtractor& i_rJoin )
  {
    ( benchmark::DoNotOptimize( i_rJoin.Values< TFlow >().data() ), ... );
    bool bChanged = false;
    ( ( bChanged = i_rJoin.Changed( ZEK::FlowTag< TFlow > ) || bChanged ), ... );
    benchmark::DoNotOptimize( bChanged );
  }
};
using VCameraKinds =
    VKinds< FlowCameraHardware, FlowCameraSettings, FlowCameraMaskGrid, FlowCentroidSet, FlowGreyscaleBlobSet,
            FlowEdgePairSet, FlowCameraCalibration, FlowCameraCalibrationHealth, FlowCentroidAssignmentSet,
            FlowCentroidLabelSet, FlowCameraPhysicalStatus, FlowCameraPhysicalSensorData, FlowCameraWarnings >;
using VSubjectKinds =
    VKinds< FlowSubjectDynamicParameters, FlowSubject, FlowSubjectApplicationData, FlowSubjectSettings >;
constexpr int CameraCount = 128, SubjectCount = 50;

class VMaker
{
public:
  /// Both groups of a frame with new items.
  ZEK::VFlowStateRef New( int i_Names )
  {
    const ZEK::VFlowStateRef State = Empty();
    Add< VCameraKinds >( *State, CameraCount, ZEK::EFlowNameDevice, i_Names );
    Add< VSubjectKinds >( *State, SubjectCount, ZEK::EFlowNameObject, i_Names );
    return State;
  }
  ZEK::VFlowStateRef SameAs( const ZEK::IFlowState& i_rState )
  {
    const ZEK::VFlowStateRef State = Empty();
    State->Merge( i_rState );
    return State;
  }

private:
  ZEK::VFlowStateRef Empty()
  {
    ZEK::VFlowStateRef State;
    if ( m_Factory->CreateState( State, { 0, 1, 1 }, {}, {} ).IsError() )
    {
      std::abort();
    }
    return State;
  }
  template < typename TKinds >
  void Add( ZEK::IFlowState& io_rState, int i_Objects, std::uint32_t i_Selector, int i_Names )
  {
    for ( int Kind = 0; Kind < TKinds::Count; ++Kind )
    {
      for ( int Place = 0; Place < i_Objects; ++Place )
      {
        ZEK::IResult Status;
        ZEK::VFlowItemRef Item;
        m_Store->CreateItem( Status, *ZEK::FindFlowItemType( TKinds::Tags[Kind] ), Item );
        Item->MutableValue().SetName( i_Selector,
                                      JoinFloor::NameOf( i_Names, JoinFloor::ObjectAt( Place, Kind, i_Objects ) ) );
        io_rState.AddItem( Item );
      }
    }
  }

  ZEK::VFlowStateFactoryRef m_Factory = HostFlow::MakeStateFactory();
  ZEK::VFlowStoreRef m_Store = HostFlow::MakeItemStore();
};

void Join( benchmark::State& i_rState, ECase i_Case )
{
  VMaker Maker;
  const ZEK::VFlowStateRef First = Maker.New( 0 );
  const ZEK::VFlowStateRef States[2] = { First, i_Case == ECaseSame ? Maker.SameAs( *First )
                                                                    : Maker.New( i_Case == ECaseRenamed ? 1 : 0 ) };
  VTaggedCoreTypeExtractor Cameras, Subjects;
  VCameraKinds::AddTo( Cameras );
  VSubjectKinds::AddTo( Subjects );
  int Frame = 0;
  for ( auto _ : i_rState )
  {
    const ZEK::IFlowState& rState = *States[Frame ^= 1];
    Cameras.Update( rState, ZEK::EFlowNameDevice, ZEK::EFlowTimeMatch::Overlap, rState.GetKey() );
    Subjects.Update( rState, ZEK::EFlowNameObject, ZEK::EFlowTimeMatch::Overlap, rState.GetKey() );
    VCameraKinds::Ask( Cameras );
    VSubjectKinds::Ask( Subjects );
  }
  if ( Cameras.Names().size() != CameraCount || Subjects.Names().size() != SubjectCount ||
       Cameras.Values< FlowCentroidSet >().size() != CameraCount )
  {
    i_rState.SkipWithError( "objects are missing" );
  }
}

template < typename TFloor >
void Floor( benchmark::State& i_rState, ECase i_Case )
{
  const std::int64_t Identity = i_Case == ECaseSame ? 1 : 2;
  const int Names = i_Case == ECaseRenamed ? 1 : 0;
  const JoinFloor::VState Cameras[2] = { JoinFloor::Make( CameraCount, VCameraKinds::Count, 1, 0 ),
                                         JoinFloor::Make( CameraCount, VCameraKinds::Count, Identity, Names ) };
  const JoinFloor::VState Subjects[2] = { JoinFloor::Make( SubjectCount, VSubjectKinds::Count, 1, 0 ),
                                          JoinFloor::Make( SubjectCount, VSubjectKinds::Count, Identity, Names ) };
  TFloor CameraJoin, SubjectJoin;
  int Frame = 0;
  for ( auto _ : i_rState )
  {
    Frame ^= 1;
    CameraJoin.Join( Cameras[Frame] );
    SubjectJoin.Join( Subjects[Frame] );
    benchmark::ClobberMemory();
  }
  if ( CameraJoin.Values.at( 3 ).size() != CameraCount || SubjectJoin.Values.at( 3 ).size() != SubjectCount )
  {
    i_rState.SkipWithError( "objects are missing" );
  }
}

constexpr auto FloorKept = Floor< JoinFloor::VKept >;
constexpr auto FloorFlat = Floor< JoinFloor::VFlat >;

BENCHMARK_CAPTURE( Join, same, ECaseSame )->Name( "join/same" )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( Join, changed, ECaseChanged )->Name( "join/changed" )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( Join, renamed, ECaseRenamed )->Name( "join/renamed" )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( FloorKept, same, ECaseSame )->Name( "join/floor/kept_same" )->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( FloorKept, changed, ECaseChanged )
    ->Name( "join/floor/kept_changed" )
    ->Unit( benchmark::kMicrosecond );
BENCHMARK_CAPTURE( FloorFlat, renamed, ECaseRenamed )
    ->Name( "join/floor/flat_renamed" )
    ->Unit( benchmark::kMicrosecond );
} // namespace
