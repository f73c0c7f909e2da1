#include <HostSources/VSimulatedCapture.h>

#include "SimulatedCameras.h"
#include "SimulatedItems.h"
#include "SimulatedMarkers.h"
#include "SimulatedStage.h"
#include "SimulatedSubjects.h"

#include <CoreMoxelTypes/FlowTypes.h>
#include <CoreMoxelTypes/Parameters.h>

#include <algorithm>
#include <cmath>
#include <limits>

using namespace CoreMoxelTypes;
using namespace ZEK;

namespace HostSources
{
namespace
{

using namespace Simulation;

template < typename T >
T Within( T i_Value, T i_Least, T i_Greatest )
{
  return i_Value >= i_Least ? std::min( i_Value, i_Greatest ) : i_Least; // not a number becomes the least
}

VSimulatedCaptureOptions Limited( VSimulatedCaptureOptions i_Options )
{
  i_Options.Cameras = Within( i_Options.Cameras, 0u, 256u );
  i_Options.Performers = Within( i_Options.Performers, 0u, 16u );
  i_Options.RateHz = Within( i_Options.RateHz, 25.0, 1000.0 );
  i_Options.NoiseMm = Within( i_Options.NoiseMm, 0.0, 50.0 );
  i_Options.GapProbability = Within( i_Options.GapProbability, 0.0, 1.0 );
  i_Options.SwapProbability = Within( i_Options.SwapProbability, 0.0, 1.0 );
  i_Options.ExtraPoints = Within( i_Options.ExtraPoints, 0u, 1000u );
  i_Options.VideoCameras = Within( i_Options.VideoCameras, 0u, i_Options.Cameras / 2 );
  i_Options.LateFrames = Within( i_Options.LateFrames, 0u, 15u );
  if ( i_Options.VideoFormat && *i_Options.VideoFormat > EPixelFormat::NV12 )
  {
    i_Options.VideoFormat.reset();
  }
  return i_Options;
}

/// The frame that comes at a place in the order of arrival, when one in 32 is late.
std::int64_t FrameAt( std::int64_t i_Place, std::int64_t i_Late )
{
  constexpr std::int64_t Round = 32, First = 8;
  const std::int64_t Place = i_Place % Round - First;
  return Place < 0 || Place > i_Late ? i_Place : Place < i_Late ? i_Place + 1 : i_Place - i_Late;
}

bool SameLabels( const VReconstructionLabelSet& i_rA, const std::vector< VReconstructionLabelSet::L >& i_rB )
{
  return std::equal( i_rA.Labels.begin(), i_rA.Labels.end(), i_rB.begin(), i_rB.end(),
                     []( const auto& i_rX, const auto& i_rY )
                     {
                       return i_rX.Reconstruction == i_rY.Reconstruction && i_rX.SubjectId == i_rY.SubjectId &&
                              i_rX.MarkerId == i_rY.MarkerId;
                     } );
}

} // namespace

struct VSimulatedCapture::VImpl
{
  explicit VImpl( const VSimulatedCaptureOptions& i_rOptions )
    : Options( Limited( i_rOptions ) )
    , Hash( Options.Seed )
    , SamplesPerFrame( std::max( 1, static_cast< int >( std::lround( 1000 / Options.RateHz ) ) ) )
    , Stage( Options )
    , Cameras( Options )
    , Subjects( Options, Stage )
    , Poses( Options.Performers )
  {
  }

  void MakeSlowItems();
  void MakeUpAxis();
  void AddPoints( double i_Seconds, std::int64_t i_Index, IFlowState& i_rState );
  void AddPoint( const VStageMarker& i_rMarker, std::int64_t i_Index, VReconstructionSet& o_rSet ) const;
  void AddLabels( IFlowState& i_rState );
  void AddPlateSamples( std::int64_t i_Index, IFlowState& i_rState );

  const VSimulatedCaptureOptions Options;
  const VHash Hash;
  const int SamplesPerFrame;
  EUpAxis Up = EUpAxis::Z;
  bool bOverruled = false;
  const VMarkerStage Stage;
  VSimulatedCameras Cameras;
  VSimulatedSubjects Subjects;
  VItemMaker Maker;
  std::vector< VWalkerPose > Poses;    // of the frame being made, by performer
  std::vector< VStageMarker > Markers; // of the frame being made
  bool bSlowMade = false;
  std::vector< VFlowItemRef > Slow;
  VFlowItemRef UpAxisItem;
  VFlowItemRef LabelItem;
  std::vector< VReconstructionLabelSet::L > Labels; // of the frame being made
  std::vector< std::vector< VFootLoad > > Loads;    // by sample
};

void VSimulatedCapture::VImpl::MakeSlowItems()
{
  Slow.clear();
  Cameras.AddSlowItems( Maker, Slow );
  Subjects.AddSlowItems( Maker, Slow );
  for ( std::size_t Plate = 0; Plate < ( Options.bForcePlates ? Plates : 0 ); ++Plate )
  {
    VDevice Device;
    FillPlate( Plate, Device );
    Maker.AddSlow< FlowDevice >( Slow, EFlowNameDevice, Device.Name, Device );
  }
  constexpr auto Half = static_cast< i32 >( FloorHalf );
  Maker.AddSlow< FlowVolumeProperties >( Slow, EFlowNameTarget, {}, { -Half, -Half, Half, Half, 0, 0 } );
  VParametersItem Volume;
  FillVolume( Volume );
  Maker.AddSlow< FlowParametersItem >( Slow, EFlowNameTarget, ReconstructionTarget, std::move( Volume ) );
  bSlowMade = Maker.Failure().IsOk();
}

void VSimulatedCapture::VImpl::MakeUpAxis()
{
  if ( auto* pAxis = Maker.Make< FlowWorldAxis >( UpAxisItem ) )
  {
    pAxis->Up = static_cast< u32 >( Up );
  }
}

void VSimulatedCapture::VImpl::AddPoint( const VStageMarker& i_rMarker, std::int64_t i_Index,
                                         VReconstructionSet& o_rSet ) const
{
  const VHash Point =
      Hash.With( EStreamNoise ).With( i_rMarker.Number ).With( static_cast< std::uint64_t >( i_Index ) );
  const D3 Noise = Point.Normal() * Options.NoiseMm;
  VReconstruction& rPoint = o_rSet.Items.emplace_back();
  rPoint.Id = i_rMarker.Number + 1;
  rPoint.Position = i_rMarker.Position + Noise;
  rPoint.Radius = static_cast< f32 >( MarkerRadius );
  rPoint.Residual = static_cast< f32 >( 0.2 + Length( Noise ) );
}

void VSimulatedCapture::VImpl::AddPoints( double i_Seconds, std::int64_t i_Index, IFlowState& i_rState )
{
  VFlowItemRef Item;
  auto* pSet = Maker.Make< FlowReconstructionSet >( Item );
  if ( !pSet )
  {
    return;
  }
  pSet->Items.reserve( Stage.MostMarkers() );
  Labels.clear();
  Stage.At( i_Seconds, Markers, Poses.data() );
  for ( VStageMarker& rMarker : Markers )
  {
    if ( rMarker.bLost )
    {
      continue;
    }
    rMarker.Reconstruction = static_cast< std::int32_t >( pSet->Items.size() );
    if ( rMarker.SubjectId != NoSubject )
    {
      Labels.push_back( { static_cast< u32 >( rMarker.Reconstruction ), rMarker.SubjectId, rMarker.MarkerId } );
    }
    AddPoint( rMarker, i_Index, *pSet );
  }
  Cameras.AddFrame( Markers, Maker, i_rState, *pSet );
  Cameras.AddVideo( Stage, i_Seconds, Maker, i_rState );
  Cameras.AddSensors( i_Seconds, Maker, i_rState );
  Subjects.AddFrame( i_Seconds, Poses, Markers, *pSet, Maker, i_rState );
  i_rState.AddItem( Item );
  AddLabels( i_rState );
}

void VSimulatedCapture::VImpl::AddLabels( IFlowState& i_rState )
{
  const auto* pLast = FlowPayload< VReconstructionLabelSet >( LabelItem.Get() );
  if ( !pLast || !SameLabels( *pLast, Labels ) )
  {
    auto* pLabels = Maker.Make< FlowReconstructionLabelSet >( LabelItem );
    if ( !pLabels )
    {
      return;
    }
    pLabels->Labels.assign( Labels.begin(), Labels.end() );
  }
  i_rState.AddItem( LabelItem );
}

void VSimulatedCapture::VImpl::AddPlateSamples( std::int64_t i_Index, IFlowState& i_rState )
{
  const double SampleRate = Options.RateHz * SamplesPerFrame;
  const std::int64_t First = i_Index * SamplesPerFrame;
  Loads.resize( static_cast< std::size_t >( SamplesPerFrame ) );
  for ( std::size_t Sample = 0; Sample < Loads.size(); ++Sample )
  {
    Loads[Sample].clear();
    std::array< VFootLoad, 2 > Feet;
    for ( const VWalkerStyle& rStyle : Stage.Styles() )
    {
      LoadFeet( rStyle, static_cast< double >( First + static_cast< std::int64_t >( Sample ) ) / SampleRate, Feet );
      Loads[Sample].insert( Loads[Sample].end(), Feet.begin(), Feet.end() );
    }
  }
  static const std::string Names[Plates] = { "Plate 1", "Plate 2" };
  for ( std::size_t Plate = 0; Plate < Plates; ++Plate )
  {
    VFlowItemRef Item;
    if ( auto* pSamples = Maker.MakeNamed< FlowDeviceSamples >( Item, EFlowNameDevice, Names[Plate] ) )
    {
      pSamples->RateHz = static_cast< f32 >( SampleRate );
      pSamples->First = static_cast< u32 >( First );
      for ( const auto& rLoads : Loads )
      {
        pSamples->Wrench.push_back( PlateWrench( Plate, rLoads ) );
      }
      i_rState.AddItem( Item );
    }
  }
}

VSimulatedCapture::VSimulatedCapture( const VSimulatedCaptureOptions& i_rOptions )
  : m_pImpl( std::make_unique< VImpl >( i_rOptions ) )
{
}

VSimulatedCapture::~VSimulatedCapture() = default;

const VSimulatedCaptureOptions& VSimulatedCapture::Options() const
{
  return m_pImpl->Options;
}

std::string VSimulatedCapture::Name() const
{
  return "Simulated Capture";
}

double VSimulatedCapture::RateHz() const
{
  return m_pImpl->Options.RateHz;
}

std::int64_t VSimulatedCapture::FrameNumber( std::int64_t i_Index ) const
{
  return FrameAt( i_Index, m_pImpl->Options.LateFrames );
}

EUpAxis VSimulatedCapture::UpAxis() const
{
  return m_pImpl->Up;
}

std::string VSimulatedCapture::UpAxisReason() const
{
  return m_pImpl->bOverruled
             ? ( m_pImpl->Up == EUpAxis::Y ? "y is up: it was asked for." : "z is up: it was asked for." )
             : "z is up: the simulated capture is made so.";
}

void VSimulatedCapture::SetUpAxis( EUpAxis i_Axis )
{
  m_pImpl->bOverruled = true;
  if ( m_pImpl->Up != i_Axis )
  {
    m_pImpl->Up = i_Axis;
    m_pImpl->UpAxisItem.Reset();
  }
}

IResult VSimulatedCapture::MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker, VFlowStateRef& o_rState )
{
  o_rState.Reset();
  VImpl& rImpl = *m_pImpl;
  const std::int64_t Ticks = TicksPerFrame();
  if ( i_Index < 0 || i_Index > std::numeric_limits< std::int64_t >::max() / Ticks - 1 )
  {
    return IResult::InvalidIndex;
  }
  if ( !i_rMaker.Factory || !i_rMaker.Store )
  {
    return IResult::InvalidHandle;
  }
  const std::int64_t Frame = FrameNumber( i_Index );
  const double Seconds = static_cast< double >( Frame ) / rImpl.Options.RateHz;
  const auto Whole = static_cast< std::int64_t >( Seconds );
  VFlowInfoA InfoA{ static_cast< std::int64_t >( std::min( Seconds * 1e9, 9e18 ) ),
                    std::llround( rImpl.Options.RateHz * 1000 ), 1000 };
  VFlowInfoB InfoB{
      static_cast< std::int32_t >( Whole / 3600 % 24 ), static_cast< std::int32_t >( Whole / 60 % 60 ),
      static_cast< std::int32_t >( Whole % 60 ),
      static_cast< std::int32_t >( ( Seconds - static_cast< double >( Whole ) ) * rImpl.Options.RateHz + 0.5 ), 0 };
  VFlowStateRef State;
  const IResult Created =
      i_rMaker.Factory->CreateState( State, { Frame * Ticks, Ticks, i_rMaker.Clock }, InfoA, InfoB );
  if ( Created.IsError() )
  {
    return Created;
  }
  rImpl.Maker.Begin( i_rMaker );
  if ( !rImpl.bSlowMade )
  {
    rImpl.MakeSlowItems();
  }
  if ( !rImpl.UpAxisItem )
  {
    rImpl.MakeUpAxis();
  }
  const VFlowTimeKey Always{ 0, std::numeric_limits< std::int64_t >::max(), i_rMaker.Clock };
  for ( const VFlowItemRef& rItem : rImpl.Slow )
  {
    State->AddItemAt( rItem, Always );
  }
  if ( rImpl.UpAxisItem )
  {
    State->AddItemAt( rImpl.UpAxisItem, Always );
  }
  rImpl.AddPoints( Seconds, Frame, *State );
  if ( rImpl.Options.bForcePlates )
  {
    rImpl.AddPlateSamples( Frame, *State );
  }
  if ( rImpl.Maker.Failure().IsOk() )
  {
    o_rState = std::move( State );
  }
  return rImpl.Maker.Failure();
}

} // namespace HostSources
