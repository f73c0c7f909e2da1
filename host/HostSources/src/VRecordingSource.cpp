#include <HostSources/VRecordingSource.h>

#include "RecordingCameras.h"
#include "RecordingItems.h"
#include "RecordingSkeletons.h"
#include "RecordingSubjects.h"
#include "RecordingVideos.h"

#include <CoreMoxelTypes/Device.h>
#include <CoreMoxelTypes/FlowTypes.h>
#include <CoreMoxelTypes/Reconstruction.h>

#include <algorithm>
#include <bit>
#include <cmath>

namespace HostSources
{
namespace
{
using namespace CoreMoxelTypes;

/// Whole metres that hold the data, and three metres each way at least; the second axis is z where y is up.
VVolumeProperties FloorOf( const VRecordingBounds& i_rBounds, EUpAxis i_Up )
{
  constexpr double Metre = 1000, Least = 3000, Most = 1e9;
  VVolumeProperties Floor{ -3000, -3000, 3000, 3000, 0, 0 };
  if ( i_rBounds.IsEmpty() )
  {
    return Floor;
  }
  const std::size_t Second = i_Up == EUpAxis::Y ? 2 : 1;
  const auto Low = [&]( std::size_t i_Axis )
  {
    const double Value = std::floor( static_cast< double >( i_rBounds.Min[i_Axis] ) / Metre ) * Metre;
    return static_cast< std::int32_t >( std::clamp( Value, -Most, -Least ) );
  };
  const auto High = [&]( std::size_t i_Axis )
  {
    const double Value = std::ceil( static_cast< double >( i_rBounds.Max[i_Axis] ) / Metre ) * Metre;
    return static_cast< std::int32_t >( std::clamp( Value, Least, Most ) );
  };
  return { Low( 0 ), Low( Second ), High( 0 ), High( Second ), 0, 0 };
}

VDevice DeviceOf( const VForcePlate& i_rPlate )
{
  VDevice Device;
  Device.Name = i_rPlate.Name;
  Device.Kind = VDevice::ForcePlate;
  std::copy( std::begin( i_rPlate.Corners ), std::end( i_rPlate.Corners ), Device.Corners );
  Device.Origin = i_rPlate.Sensor;
  return Device;
}
} // namespace

/// The items that go on from one state to the next.
class VRecordingSource::VState
{
public:
  explicit VState( const VRecording& i_rRecording )
    : m_rRecording( i_rRecording )
    , m_Subjects( SubjectsOf( i_rRecording ) )
    , m_Cameras( i_rRecording, m_Subjects )
    , m_Videos( i_rRecording )
    , m_Skeletons( i_rRecording, static_cast< u32 >( m_Subjects.Subjects.size() ) + 1 )
  {
  }

  ZEK::IResult MakeSlowItems( const VStateMaker& i_rMaker, EUpAxis i_Up );
  ZEK::IResult MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index );
  ZEK::IResult AddSamples( const VStateMaker& i_rMaker, std::int64_t i_Index, ZEK::IFlowState& io_rState );
  void AddItems( const ZEK::VFlowTimeKey& i_rSlowKey, ZEK::IFlowState& io_rState ) const;
  VRecordingVideos& Videos() { return m_Videos; }

private:
  ZEK::IResult MakeAxisItems( const VStateMaker& i_rMaker, EUpAxis i_Up );
  ZEK::IResult MakeSubjectItems( const VStateMaker& i_rMaker );
  ZEK::IResult MakePoints( const VStateMaker& i_rMaker, std::int64_t i_Index );
  ZEK::IResult MakeLabels( const VStateMaker& i_rMaker, std::int64_t i_Index );
  bool SamePoints( std::int64_t i_A, std::int64_t i_B ) const;
  std::span< const std::uint8_t > Masks( std::int64_t i_Index ) const;

  const VRecording& m_rRecording;
  const VRecordingSubjects m_Subjects;
  VRecordingCameras m_Cameras;
  VRecordingVideos m_Videos;
  VRecordingSkeletons m_Skeletons;
  ZEK::VFlowStoreRef m_Store; ///< that made the items
  EUpAxis m_Up = EUpAxis::Z;
  std::vector< ZEK::VFlowItemRef > m_Slow;
  ZEK::VFlowItemRef m_Axis, m_Floor;
  std::int64_t m_PointsOf = -1; ///< the frame that `m_Points` was made of
  std::int64_t m_LabelsOf = -1;
  ZEK::VFlowItemRef m_Points, m_Labels;
};

std::span< const std::uint8_t > VRecordingSource::VState::Masks( std::int64_t i_Index ) const
{
  if ( m_rRecording.CameraMasks.empty() )
  {
    return {};
  }
  const std::size_t Count = m_rRecording.PointCount();
  return { m_rRecording.CameraMasks.data() + static_cast< std::size_t >( i_Index ) * Count, Count };
}

bool VRecordingSource::VState::SamePoints( std::int64_t i_A, std::int64_t i_B ) const
{
  return i_A == i_B || ( SameBits( m_rRecording.Frame( i_A ), m_rRecording.Frame( i_B ) ) &&
                         SameBits( m_rRecording.UnlabelledFrame( i_A ), m_rRecording.UnlabelledFrame( i_B ) ) &&
                         SameBits( Masks( i_A ), Masks( i_B ) ) );
}

ZEK::IResult VRecordingSource::VState::MakeAxisItems( const VStateMaker& i_rMaker, EUpAxis i_Up )
{
  ZEK::IResult Result;
  if ( auto* pAxis = MakeItem< FlowWorldAxis >( i_rMaker, m_Axis, Result ) )
  {
    pAxis->Up = static_cast< u32 >( i_Up );
  }
  if ( Result.IsOk() )
  {
    if ( auto* pFloor = MakeItem< FlowVolumeProperties >( i_rMaker, m_Floor, Result ) )
    {
      *pFloor = FloorOf( m_rRecording.Bounds, i_Up );
    }
  }
  Result = Result.IsOk() ? m_Skeletons.MakePoses( i_rMaker, i_Up ) : Result;
  if ( Result.IsOk() )
  {
    m_Up = i_Up;
  }
  else
  {
    // Half of them must not be taken for all: the next frame makes everything anew.
    m_Store = {};
  }
  return Result;
}

ZEK::IResult VRecordingSource::VState::MakeSubjectItems( const VStateMaker& i_rMaker )
{
  ZEK::IResult Result;
  ZEK::VFlowItemRef Item;
  for ( std::size_t Index = 0; Index < m_Subjects.Subjects.size() && Result.IsOk(); ++Index )
  {
    const VSubject& rSubject = m_Subjects.Subjects[Index];
    if ( auto* pSubject = MakeItem< FlowSubject >( i_rMaker, Item, Result ) )
    {
      *pSubject = rSubject;
      Item->MutableValue().SetName( ZEK::EFlowNameObject, rSubject.Name );
      m_Slow.push_back( Item );
    }
    if ( auto* pLook = MakeItem< FlowSubjectApplicationData >( i_rMaker, Item, Result ) )
    {
      pLook->MarkerColours = m_Subjects.Colours[Index];
      Item->MutableValue().SetName( ZEK::EFlowNameObject, rSubject.Name );
      m_Slow.push_back( Item );
    }
  }
  return Result;
}

ZEK::IResult VRecordingSource::VState::MakeSlowItems( const VStateMaker& i_rMaker, EUpAxis i_Up )
{
  if ( m_Store == i_rMaker.Store )
  {
    return m_Up == i_Up ? ZEK::IResult() : MakeAxisItems( i_rMaker, i_Up );
  }
  m_Store = {};
  m_Slow.clear();
  m_Points = {};
  m_Labels = {};
  m_PointsOf = m_LabelsOf = -1;
  m_Videos.Forget();
  ZEK::IResult Result = MakeAxisItems( i_rMaker, i_Up );
  Result = Result.IsOk() ? MakeSubjectItems( i_rMaker ) : Result;
  Result = Result.IsOk() ? m_Skeletons.MakeSlowItems( i_rMaker, m_Slow ) : Result;
  Result = Result.IsOk() ? m_Cameras.MakeSlowItems( i_rMaker, m_Slow ) : Result;
  ZEK::VFlowItemRef Item;
  for ( const VForcePlate& rPlate : m_rRecording.ForcePlates )
  {
    if ( Result.IsError() )
    {
      return Result;
    }
    if ( auto* pDevice = MakeItem< FlowDevice >( i_rMaker, Item, Result ) )
    {
      *pDevice = DeviceOf( rPlate );
      Item->MutableValue().SetName( ZEK::EFlowNameDevice, rPlate.Name );
      m_Slow.push_back( Item );
    }
  }
  if ( Result.IsOk() )
  {
    m_Store = i_rMaker.Store;
  }
  return Result;
}

ZEK::IResult VRecordingSource::VState::MakePoints( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  ZEK::IResult Result;
  auto* pSet = MakeItem< FlowReconstructionSet >( i_rMaker, m_Points, Result );
  m_PointsOf = pSet ? i_Index : -1;
  if ( !pSet )
  {
    return Result;
  }
  const auto Points = m_rRecording.Frame( i_Index );
  const auto Unlabelled = m_rRecording.UnlabelledFrame( i_Index );
  const auto PointMasks = Masks( i_Index );
  pSet->Items.reserve( Points.size() + Unlabelled.size() );
  u32 Id = 0;
  const auto Add = [&]( const VRecordingPoint& i_rPoint, u32 i_Rays )
  {
    ++Id;
    if ( i_rPoint.IsValid() )
    {
      pSet->Items.push_back( { Id, { i_rPoint.x, i_rPoint.y, i_rPoint.z }, MarkerRadius, i_rPoint.Residual, i_Rays } );
    }
  };
  for ( std::size_t Point = 0; Point < Points.size(); ++Point )
  {
    Add( Points[Point],
         PointMasks.empty() ? 0 : static_cast< u32 >( std::popcount( static_cast< unsigned >( PointMasks[Point] ) ) ) );
  }
  for ( const VRecordingPoint& rPoint : Unlabelled )
  {
    Add( rPoint, 0 );
  }
  return Result;
}

/// Which named points are there decides the labels; where they lie does not.
ZEK::IResult VRecordingSource::VState::MakeLabels( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  const auto Points = m_rRecording.Frame( i_Index );
  if ( m_LabelsOf >= 0 )
  {
    const auto Before = m_rRecording.Frame( m_LabelsOf );
    if ( std::equal( Points.begin(), Points.end(), Before.begin(), Before.end(),
                     []( const VRecordingPoint& i_rA, const VRecordingPoint& i_rB )
                     {
                       return i_rA.IsValid() == i_rB.IsValid();
                     } ) )
    {
      return ZEK::IResult::Ok;
    }
  }
  ZEK::IResult Result;
  auto* pSet = MakeItem< FlowReconstructionLabelSet >( i_rMaker, m_Labels, Result );
  m_LabelsOf = pSet ? i_Index : -1;
  if ( !pSet )
  {
    return Result;
  }
  pSet->Labels.reserve( Points.size() );
  u32 Entry = 0;
  for ( std::size_t Point = 0; Point < Points.size(); ++Point )
  {
    if ( !Points[Point].IsValid() )
    {
      continue;
    }
    const VRecordingSubjects::VPlace& rPlace = m_Subjects.Places[Point];
    if ( rPlace.SubjectId != 0 )
    {
      pSet->Labels.push_back( { Entry, rPlace.SubjectId, rPlace.MarkerIndex } );
    }
    ++Entry;
  }
  return Result;
}

ZEK::IResult VRecordingSource::VState::MakeFastItems( const VStateMaker& i_rMaker, std::int64_t i_Index )
{
  ZEK::IResult Result;
  m_Videos.Want( i_Index ); // decoders work while the rest is made
  // Of solved poses alone no point was measured, which is not the same as none being there.
  const bool bPoints =
      m_rRecording.PointCount() > 0 || !m_rRecording.UnlabelledBegin.empty() || m_rRecording.Skeletons.empty();
  if ( bPoints && ( m_PointsOf < 0 || !SamePoints( m_PointsOf, i_Index ) ) )
  {
    Result = MakePoints( i_rMaker, i_Index );
  }
  if ( Result.IsOk() && !m_Subjects.Subjects.empty() )
  {
    Result = MakeLabels( i_rMaker, i_Index );
  }
  Result = Result.IsOk() ? m_Skeletons.MakeFastItems( i_rMaker, i_Index ) : Result;
  Result = Result.IsOk() ? m_Cameras.MakeFastItems( i_rMaker, i_Index ) : Result;
  return Result.IsOk() ? m_Videos.MakeItems( i_rMaker, i_Index ) : Result;
}

ZEK::IResult VRecordingSource::VState::AddSamples( const VStateMaker& i_rMaker, std::int64_t i_Index,
                                                   ZEK::IFlowState& io_rState )
{
  const std::size_t PerFrame = m_rRecording.AnalogPerFrame;
  const std::size_t First = static_cast< std::size_t >( i_Index ) * PerFrame;
  ZEK::IResult Result;
  ZEK::VFlowItemRef Item;
  for ( const VForcePlate& rPlate : m_rRecording.ForcePlates )
  {
    if ( rPlate.Wrench.size() < First + PerFrame || PerFrame == 0 )
    {
      continue;
    }
    auto* pSamples = MakeItem< FlowDeviceSamples >( i_rMaker, Item, Result );
    if ( !pSamples )
    {
      return Result;
    }
    pSamples->RateHz = static_cast< float >( m_rRecording.AnalogRateHz() );
    pSamples->First = static_cast< u32 >( First );
    const auto Begin = rPlate.Wrench.begin() + static_cast< std::ptrdiff_t >( First );
    pSamples->Wrench.assign( Begin, Begin + static_cast< std::ptrdiff_t >( PerFrame ) );
    Item->MutableValue().SetName( ZEK::EFlowNameDevice, rPlate.Name );
    io_rState.AddItem( Item );
  }
  return Result;
}

void VRecordingSource::VState::AddItems( const ZEK::VFlowTimeKey& i_rSlowKey, ZEK::IFlowState& io_rState ) const
{
  if ( m_Points )
  {
    io_rState.AddItem( m_Points );
  }
  if ( m_Labels )
  {
    io_rState.AddItem( m_Labels );
  }
  m_Skeletons.AddItems( i_rSlowKey, io_rState );
  m_Cameras.AddItems( io_rState );
  m_Videos.AddItems( io_rState );
  for ( const ZEK::VFlowItemRef& rItem : m_Slow )
  {
    io_rState.AddItemAt( rItem, i_rSlowKey );
  }
  io_rState.AddItemAt( m_Axis, i_rSlowKey );
  io_rState.AddItemAt( m_Floor, i_rSlowKey );
}

VRecordingSource::VRecordingSource( std::shared_ptr< const VRecording > i_pRecording )
  : m_pRecording( std::move( i_pRecording ) )
  , m_pState( std::make_unique< VState >( *m_pRecording ) )
  , m_UpAxis( m_pRecording->UpAxis )
{
}

VRecordingSource::~VRecordingSource() = default;

std::string VRecordingSource::Name() const
{
  return m_pRecording->Name;
}

double VRecordingSource::RateHz() const
{
  return m_pRecording->RateHz;
}

std::int64_t VRecordingSource::FrameCount() const
{
  return m_pRecording->FrameCount;
}

std::int64_t VRecordingSource::FrameNumber( std::int64_t i_Index ) const
{
  return m_pRecording->FirstFrame + i_Index;
}

EUpAxis VRecordingSource::UpAxis() const
{
  return m_UpAxis;
}

std::string VRecordingSource::UpAxisReason() const
{
  if ( !m_bOverruled )
  {
    return m_pRecording->UpAxisReason;
  }
  return std::string( m_UpAxis.load() == EUpAxis::Y ? "y" : "z" ) +
         " is up: it was chosen by hand. The recording: " + m_pRecording->UpAxisReason;
}

void VRecordingSource::SetUpAxis( EUpAxis i_Axis )
{
  m_UpAxis = i_Axis;
  m_bOverruled = true;
}

void VRecordingSource::SetOnReady( std::function< void() > i_OnReady )
{
  m_pState->Videos().SetOnReady( i_OnReady );
}

std::int64_t VRecordingSource::NearestFrame( double i_Seconds ) const
{
  const double Last = static_cast< double >( std::max< std::int64_t >( FrameCount() - 1, 0 ) );
  // A time that is no number goes to the first frame.
  return static_cast< std::int64_t >( std::round( std::min( std::max( 0.0, i_Seconds * RateHz() ), Last ) ) );
}

ZEK::IResult VRecordingSource::MakeState( std::int64_t i_Index, const VStateMaker& i_rMaker,
                                          ZEK::VFlowStateRef& o_rState )
{
  o_rState.Reset();
  if ( i_Index < 0 || i_Index >= FrameCount() )
  {
    return ZEK::IResult::InvalidIndex;
  }
  if ( !i_rMaker.Factory || !i_rMaker.Store )
  {
    return ZEK::IResult::InvalidHandle;
  }
  const std::int64_t Ticks = TicksPerFrame();
  const double Rate = RateHz();
  const bool bWhole = Rate == std::floor( Rate );
  const ZEK::VFlowInfoA InfoA{ std::llround( static_cast< double >( i_Index ) / Rate * 1e9 ),
                               std::llround( bWhole ? Rate : Rate * 1000 ), bWhole ? 1 : 1000 };
  ZEK::VFlowStateRef State;
  ZEK::IResult Result =
      i_rMaker.Factory->CreateState( State, { i_Index * Ticks, Ticks, i_rMaker.Clock }, InfoA, ZEK::VFlowInfoB{} );
  Result = Result.IsOk() ? m_pState->MakeSlowItems( i_rMaker, UpAxis() ) : Result;
  Result = Result.IsOk() ? m_pState->MakeFastItems( i_rMaker, i_Index ) : Result;
  Result = Result.IsOk() ? m_pState->AddSamples( i_rMaker, i_Index, *State ) : Result;
  if ( Result.IsOk() )
  {
    m_pState->AddItems( { 0, FrameCount() * Ticks, i_rMaker.Clock }, *State );
    o_rState = std::move( State );
  }
  return Result;
}

} // namespace HostSources
