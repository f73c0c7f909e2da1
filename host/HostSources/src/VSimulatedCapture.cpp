#include <HostSources/VSimulatedCapture.h>

#include "SimulatedStage.h"

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

constexpr double GapWindow = 0.2;   // s: a gap lies within one window
constexpr double ExtraWindow = 0.5; // s: that an extra point stays or is away

/// What a random number is for; keeps the streams apart.
enum EStream : std::uint64_t
{
  EStreamNoise = 1,
  EStreamGap,
  EStreamExtra,
  EStreamRays
};

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
  i_Options.ExtraPoints = Within( i_Options.ExtraPoints, 0u, 1000u );
  return i_Options;
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
  {
    for ( std::uint32_t Performer = 0; Performer < Options.Performers; ++Performer )
    {
      Styles.push_back( PerformerStyle( Options, Performer ) );
    }
  }

  /// Makes one item and keeps the first failure; the payload is null after one.
  template < typename TFlow >
  typename FlowValueType< TFlow >::type* Make( const VStateMaker& i_rMaker, VFlowItemRef& o_rItem )
  {
    IResult Status;
    i_rMaker.Store->CreateItem( Status, FlowValueType< TFlow >::Descriptor, o_rItem );
    Failure = Failure.IsError() ? Failure : Status;
    return FlowMutablePayload< typename FlowValueType< TFlow >::type >( o_rItem.Get() );
  }
  template < typename TFlow, typename TFill >
  void MakeSlow( const VStateMaker& i_rMaker, EFlowName i_Selector, const std::string& i_rName, TFill i_Fill )
  {
    VFlowItemRef Item;
    if ( auto* pPayload = Make< TFlow >( i_rMaker, Item ) )
    {
      i_Fill( *pPayload );
      if ( !i_rName.empty() )
      {
        Item->MutableValue().SetName( i_Selector, i_rName );
      }
      Slow.push_back( std::move( Item ) );
    }
  }

  void MakeSlowItems( const VStateMaker& i_rMaker );
  void MakeUpAxis( const VStateMaker& i_rMaker );
  void AddPoints( double i_Seconds, std::int64_t i_Index, const VStateMaker& i_rMaker, IFlowState& i_rState );
  void AddPoint( const D3& i_rPosition, std::uint32_t i_Number, std::int64_t i_Index,
                 VReconstructionSet& o_rSet ) const;
  bool IsInGap( std::uint32_t i_Number, double i_Seconds ) const;
  void AddExtraPoints( double i_Seconds, std::int64_t i_Index, VReconstructionSet& o_rSet ) const;
  void AddLabels( const VStateMaker& i_rMaker, IFlowState& i_rState );
  void AddPlateSamples( std::int64_t i_Index, const VStateMaker& i_rMaker, IFlowState& i_rState );

  const VSimulatedCaptureOptions Options;
  const VHash Hash;
  const int SamplesPerFrame;
  EUpAxis Up = EUpAxis::Z;
  bool bOverruled = false;
  IResult Failure;
  std::vector< VWalkerStyle > Styles;
  bool bSlowMade = false;
  std::vector< VFlowItemRef > Slow;
  VFlowItemRef UpAxisItem;
  VFlowItemRef LabelItem;
  std::vector< VReconstructionLabelSet::L > Labels; // of the frame being made
  std::vector< std::vector< VFootLoad > > Loads;    // by sample
};

void VSimulatedCapture::VImpl::MakeSlowItems( const VStateMaker& i_rMaker )
{
  Slow.clear();
  for ( std::uint32_t Camera = 0; Camera < Options.Cameras; ++Camera )
  {
    VCameraHardware Hardware;
    VCameraCalibration Calibration;
    FillCamera( Camera, Options.Cameras, Options.RateHz, Hardware, Calibration );
    MakeSlow< FlowCameraHardware >( i_rMaker, EFlowNameDevice, Hardware.Name,
                                    [&]( VCameraHardware& o_rValue )
                                    {
                                      o_rValue = Hardware;
                                    } );
    MakeSlow< FlowCameraCalibration >( i_rMaker, EFlowNameDevice, Hardware.Name,
                                       [&]( VCameraCalibration& o_rValue )
                                       {
                                         o_rValue = Calibration;
                                       } );
  }
  for ( std::uint32_t Performer = 0; Performer < Options.Performers; ++Performer )
  {
    const std::string Subject = PerformerName( Performer );
    MakeSlow< FlowSubject >( i_rMaker, EFlowNameObject, Subject,
                             [&]( VSubject& o_rValue )
                             {
                               FillSubject( Performer, o_rValue );
                             } );
    MakeSlow< FlowSubjectApplicationData >( i_rMaker, EFlowNameObject, Subject,
                                            [&]( VSubjectApplicationData& o_rValue )
                                            {
                                              FillColours( Performer, o_rValue );
                                            } );
  }
  for ( std::size_t Plate = 0; Plate < ( Options.bForcePlates ? Plates : 0 ); ++Plate )
  {
    VDevice Device;
    FillPlate( Plate, Device );
    MakeSlow< FlowDevice >( i_rMaker, EFlowNameDevice, Device.Name,
                            [&]( VDevice& o_rValue )
                            {
                              o_rValue = Device;
                            } );
  }
  MakeSlow< FlowVolumeProperties >( i_rMaker, EFlowNameTarget, {},
                                    []( VVolumeProperties& o_rValue )
                                    {
                                      constexpr auto Half = static_cast< i32 >( FloorHalf );
                                      o_rValue = { -Half, -Half, Half, Half, 0, 0 };
                                    } );
  MakeSlow< FlowParametersItem >( i_rMaker, EFlowNameTarget, ReconstructionTarget, FillVolume );
  bSlowMade = Failure.IsOk();
}

void VSimulatedCapture::VImpl::MakeUpAxis( const VStateMaker& i_rMaker )
{
  if ( auto* pAxis = Make< FlowWorldAxis >( i_rMaker, UpAxisItem ) )
  {
    pAxis->Up = static_cast< u32 >( Up );
  }
}

void VSimulatedCapture::VImpl::AddPoint( const D3& i_rPosition, std::uint32_t i_Number, std::int64_t i_Index,
                                         VReconstructionSet& o_rSet ) const
{
  const VHash Point = Hash.With( EStreamNoise ).With( i_Number ).With( static_cast< std::uint64_t >( i_Index ) );
  const D3 Noise = Point.Normal() * Options.NoiseMm;
  // Rays change with the place, not with every frame.
  const std::uint64_t Window = static_cast< std::uint64_t >( static_cast< double >( i_Index ) / Options.RateHz );
  const std::uint64_t Spread = Hash.With( EStreamRays ).With( i_Number ).With( Window ).Bits() % 7;
  VReconstruction& rPoint = o_rSet.Items.emplace_back();
  rPoint.Id = i_Number + 1;
  rPoint.Position = i_rPosition + Noise;
  rPoint.Radius = 7;
  rPoint.Residual = static_cast< f32 >( 0.2 + Length( Noise ) );
  rPoint.Rays = static_cast< u32 >( std::min< std::uint64_t >( 2 + Spread, std::max( Options.Cameras, 2u ) ) );
}

bool VSimulatedCapture::VImpl::IsInGap( std::uint32_t i_Number, double i_Seconds ) const
{
  const double Window = std::floor( i_Seconds / GapWindow );
  const VHash Gap = Hash.With( EStreamGap ).With( i_Number ).With( static_cast< std::uint64_t >( Window ) );
  if ( Gap.Uniform() >= Options.GapProbability )
  {
    return false;
  }
  const double Begin = Gap.With( 1 ).Uniform() * 0.5, End = 0.5 + Gap.With( 2 ).Uniform() * 0.5;
  const double Share = i_Seconds / GapWindow - Window;
  return Share >= Begin && Share < End;
}

void VSimulatedCapture::VImpl::AddExtraPoints( double i_Seconds, std::int64_t i_Index,
                                               VReconstructionSet& o_rSet ) const
{
  const auto First = static_cast< std::uint32_t >( Styles.size() * WalkerMarkers + ObjectMarkers );
  const auto Window = static_cast< std::uint64_t >( i_Seconds / ExtraWindow );
  for ( std::uint32_t Extra = 0; Extra < Options.ExtraPoints; ++Extra )
  {
    const VHash Place = Hash.With( EStreamExtra ).With( Extra ).With( Window );
    if ( Place.Uniform() < 0.5 )
    {
      const auto Across = [&]( std::uint64_t i_Axis )
      {
        return ( 2 * Place.With( i_Axis ).Uniform() - 1 ) * ( FloorHalf - 100 );
      };
      AddPoint( { Across( 1 ), Across( 2 ), 200 + 2000 * Place.With( 3 ).Uniform() }, First + Extra, i_Index, o_rSet );
    }
  }
}

void VSimulatedCapture::VImpl::AddPoints( double i_Seconds, std::int64_t i_Index, const VStateMaker& i_rMaker,
                                          IFlowState& i_rState )
{
  VFlowItemRef Item;
  auto* pSet = Make< FlowReconstructionSet >( i_rMaker, Item );
  if ( !pSet )
  {
    return;
  }
  pSet->Items.reserve( Styles.size() * WalkerMarkers + ObjectMarkers + Options.ExtraPoints );
  Labels.clear();
  VWalkerPose Pose;
  for ( std::uint32_t Performer = 0; Performer < Styles.size(); ++Performer )
  {
    PoseWalker( Styles[Performer], i_Seconds, Pose );
    for ( std::uint32_t Marker = 0; Marker < WalkerMarkers; ++Marker )
    {
      const auto Number = static_cast< std::uint32_t >( Performer * WalkerMarkers + Marker );
      if ( !IsInGap( Number, i_Seconds ) )
      {
        Labels.push_back( { static_cast< u32 >( pSet->Items.size() ), Performer + 1, Marker } );
        AddPoint( Pose.Markers[Marker], Number, i_Index, *pSet );
      }
    }
  }
  if ( Options.bObjects )
  {
    std::array< D3, ObjectMarkers > Objects;
    PoseObjects( i_Seconds, Objects );
    auto Number = static_cast< std::uint32_t >( Styles.size() * WalkerMarkers );
    for ( const D3& rMarker : Objects )
    {
      AddPoint( rMarker, Number++, i_Index, *pSet );
    }
  }
  AddExtraPoints( i_Seconds, i_Index, *pSet );
  i_rState.AddItem( Item );
  AddLabels( i_rMaker, i_rState );
}

void VSimulatedCapture::VImpl::AddLabels( const VStateMaker& i_rMaker, IFlowState& i_rState )
{
  const auto* pLast = FlowPayload< VReconstructionLabelSet >( LabelItem.Get() );
  if ( !pLast || !SameLabels( *pLast, Labels ) )
  {
    auto* pLabels = Make< FlowReconstructionLabelSet >( i_rMaker, LabelItem );
    if ( !pLabels )
    {
      return;
    }
    pLabels->Labels.assign( Labels.begin(), Labels.end() );
  }
  i_rState.AddItem( LabelItem );
}

void VSimulatedCapture::VImpl::AddPlateSamples( std::int64_t i_Index, const VStateMaker& i_rMaker,
                                                IFlowState& i_rState )
{
  const double SampleRate = Options.RateHz * SamplesPerFrame;
  const std::int64_t First = i_Index * SamplesPerFrame;
  Loads.resize( static_cast< std::size_t >( SamplesPerFrame ) );
  for ( std::size_t Sample = 0; Sample < Loads.size(); ++Sample )
  {
    Loads[Sample].clear();
    std::array< VFootLoad, 2 > Feet;
    for ( const VWalkerStyle& rStyle : Styles )
    {
      LoadFeet( rStyle, static_cast< double >( First + static_cast< std::int64_t >( Sample ) ) / SampleRate, Feet );
      Loads[Sample].insert( Loads[Sample].end(), Feet.begin(), Feet.end() );
    }
  }
  for ( std::size_t Plate = 0; Plate < Plates; ++Plate )
  {
    VFlowItemRef Item;
    if ( auto* pSamples = Make< FlowDeviceSamples >( i_rMaker, Item ) )
    {
      pSamples->RateHz = static_cast< f32 >( SampleRate );
      pSamples->First = static_cast< u32 >( First );
      for ( const auto& rLoads : Loads )
      {
        pSamples->Wrench.push_back( PlateWrench( Plate, rLoads ) );
      }
      Item->MutableValue().SetName( EFlowNameDevice, Plate == 0 ? "Plate 1" : "Plate 2" );
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
  const double Seconds = static_cast< double >( i_Index ) / rImpl.Options.RateHz;
  const auto Whole = static_cast< std::int64_t >( Seconds );
  VFlowInfoA InfoA{ static_cast< std::int64_t >( std::min( Seconds * 1e9, 9e18 ) ),
                    std::llround( rImpl.Options.RateHz * 1000 ), 1000 };
  VFlowInfoB InfoB{
      static_cast< std::int32_t >( Whole / 3600 % 24 ), static_cast< std::int32_t >( Whole / 60 % 60 ),
      static_cast< std::int32_t >( Whole % 60 ),
      static_cast< std::int32_t >( ( Seconds - static_cast< double >( Whole ) ) * rImpl.Options.RateHz + 0.5 ), 0 };
  VFlowStateRef State;
  rImpl.Failure = i_rMaker.Factory->CreateState( State, { i_Index * Ticks, Ticks, i_rMaker.Clock }, InfoA, InfoB );
  if ( rImpl.Failure.IsError() )
  {
    return rImpl.Failure;
  }
  if ( !rImpl.bSlowMade )
  {
    rImpl.MakeSlowItems( i_rMaker );
  }
  if ( !rImpl.UpAxisItem )
  {
    rImpl.MakeUpAxis( i_rMaker );
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
  rImpl.AddPoints( Seconds, i_Index, i_rMaker, *State );
  if ( rImpl.Options.bForcePlates )
  {
    rImpl.AddPlateSamples( i_Index, i_rMaker, *State );
  }
  if ( rImpl.Failure.IsOk() )
  {
    o_rState = std::move( State );
  }
  return rImpl.Failure;
}

} // namespace HostSources
