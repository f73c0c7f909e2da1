#include "CameraWorld.h"

#include "UpAxis.h"

#include <ComputeCameraModel/VRadialDistortion.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <optional>

namespace HostSources
{
namespace
{
using CoreMoxelTypes::D3;

/// Less likely ones say little about where a point is.
constexpr float LikelyEnough = 0.3f;
/// A person further away than this part of the image's diagonal is another one.
constexpr double PersonRange = 0.1;
/// What a point counts for that a camera cannot see, px: one stray point must not decide for all.
constexpr double FarAway = 1e4;
/// What the search for the axes looks at, at the most.
constexpr std::size_t SampledFrames = 200;

/// Projects with the lens as well as it is known.
class VProjection
{
public:
  explicit VProjection( const VCalibratedCamera& i_rCamera )
  {
    const auto& rModel = i_rCamera.Calibration;
    if ( i_rCamera.Pinhole )
    {
      m_Pinhole = *i_rCamera.Pinhole;
    }
    else if ( rModel && rModel->FocalLength > 0 )
    {
      const double Aspect = rModel->AspectRatio * i_rCamera.Hardware.PixelAspect;
      m_Pinhole.Fx = rModel->FocalLength;
      m_Pinhole.Fy = rModel->FocalLength / Aspect;
      m_Pinhole.Cx = rModel->PrincipalPoint[0];
      m_Pinhole.Cy = ( rModel->PrincipalPoint[1] + 0.5 ) / Aspect - 0.5;
      m_Pinhole.Skew = rModel->Skew;
      m_Pinhole.Rotation = rModel->Rotation;
      const bool bLens = rModel->RadialModel <= 1 && rModel->RadialParameters.size() == rModel->RadialModel + 2;
      if ( bLens )
      {
        m_Lens.emplace(
            ComputeCameraModel::VLensCalibration{ rModel->RadialModel,
                                                  rModel->RadialParameters,
                                                  { rModel->DistortionCentre[0], rModel->DistortionCentre[1] } } );
      }
    }
    m_R = RotationMatrix( m_Pinhole.Rotation );
    m_T = m_Pinhole.Translation;
    if ( !i_rCamera.Pinhole && rModel )
    {
      const D3& rP = rModel->Position;
      m_T = { -( m_R[0] * rP.x + m_R[1] * rP.y + m_R[2] * rP.z ), -( m_R[3] * rP.x + m_R[4] * rP.y + m_R[5] * rP.z ),
              -( m_R[6] * rP.x + m_R[7] * rP.y + m_R[8] * rP.z ) };
    }
  }

  bool IsUsable() const { return m_Pinhole.Fx > 0; }
  /// Distance in the raw image, px; a point behind the camera, or off its lens, is infinitely far.
  double Distance( const D3& i_rPoint, const VRecordingDetection& i_rSeen ) const
  {
    const double X = m_R[0] * i_rPoint.x + m_R[1] * i_rPoint.y + m_R[2] * i_rPoint.z + m_T.x;
    const double Y = m_R[3] * i_rPoint.x + m_R[4] * i_rPoint.y + m_R[5] * i_rPoint.z + m_T.y;
    const double Z = m_R[6] * i_rPoint.x + m_R[7] * i_rPoint.y + m_R[8] * i_rPoint.z + m_T.z;
    if ( !( Z > 0 ) )
    {
      return std::numeric_limits< double >::infinity();
    }
    const VPinholeCamera::VPoint Ideal = m_Pinhole.ToImage( { X / Z, Y / Z } );
    ComputeCameraModel::VImagePoint Raw{ Ideal.x, Ideal.y };
    if ( m_Lens && !m_Lens->Distort( { Ideal.x, Ideal.y }, Raw ) )
    {
      return std::numeric_limits< double >::infinity();
    }
    return std::hypot( Raw.x - static_cast< double >( i_rSeen.x ), Raw.y - static_cast< double >( i_rSeen.y ) );
  }

private:
  VPinholeCamera m_Pinhole;
  std::optional< ComputeCameraModel::VRadialDistortion > m_Lens;
  std::array< double, 9 > m_R{};
  D3 m_T;
};

D3 Turned( const VAxisTurn& i_rTurn, double i_X, double i_Y, double i_Z )
{
  const double In[] = { i_X, i_Y, i_Z };
  const auto Axis = [&]( std::size_t i_Axis )
  {
    return In[i_rTurn.From[i_Axis]] * i_rTurn.Sign[i_Axis];
  };
  return { Axis( 0 ), Axis( 1 ), Axis( 2 ) };
}

bool IsProper( const VAxisTurn& i_rTurn )
{
  const auto& rF = i_rTurn.From;
  const bool bEven = ( rF[1] - rF[0] + 3 ) % 3 == 1;
  return ( bEven ? 1 : -1 ) * i_rTurn.Sign[0] * i_rTurn.Sign[1] * i_rTurn.Sign[2] == 1;
}

/// All 24, none of them mirrored; the one that turns nothing first.
std::vector< VAxisTurn > AllTurns()
{
  std::vector< VAxisTurn > All;
  VAxisTurn Turn;
  do
  {
    for ( int Signs = 0; Signs < 8; ++Signs )
    {
      Turn.Sign = { Signs & 4 ? -1 : 1, Signs & 2 ? -1 : 1, Signs & 1 ? -1 : 1 };
      if ( IsProper( Turn ) )
      {
        All.push_back( Turn );
      }
    }
  } while ( std::next_permutation( Turn.From.begin(), Turn.From.end() ) );
  return All;
}

std::vector< VProjection > ProjectionsOf( const VRecording& i_rRecording )
{
  std::vector< VProjection > All;
  for ( const VRecordingCamera& rCamera : i_rRecording.Cameras )
  {
    All.emplace_back( rCamera.Camera );
  }
  return All;
}

struct VMean
{
  double Sum = 0;
  std::size_t Count = 0;
  double Value() const { return Count > 0 ? Sum / static_cast< double >( Count ) : 0; }
};

/// Calls for each person of a frame: its detections lie together.
template < typename TTake >
void ForEachPerson( std::span< const VRecordingDetection > i_Detections, TTake&& i_rTake )
{
  for ( std::size_t Begin = 0, End = 0; Begin < i_Detections.size(); Begin = End )
  {
    while ( End < i_Detections.size() && i_Detections[End].Person == i_Detections[Begin].Person )
    {
      ++End;
    }
    i_rTake( i_Detections.subspan( Begin, End - Begin ) );
  }
}

/// Over the likely detections of points that are there.
VMean PersonDistance( const VProjection& i_rProjection, std::span< const VRecordingDetection > i_Person,
                      std::span< const VRecordingPoint > i_Points, const VAxisTurn& i_rTurn )
{
  VMean Mean;
  for ( const VRecordingDetection& rSeen : i_Person )
  {
    if ( rSeen.Point < 0 || rSeen.Likelihood < LikelyEnough )
    {
      continue;
    }
    const VRecordingPoint& rPoint = i_Points[static_cast< std::size_t >( rSeen.Point )];
    if ( rPoint.IsValid() )
    {
      const D3 Place = Turned( i_rTurn, static_cast< double >( rPoint.x ), static_cast< double >( rPoint.y ),
                               static_cast< double >( rPoint.z ) );
      Mean.Sum += std::min( i_rProjection.Distance( Place, rSeen ), FarAway );
      ++Mean.Count;
    }
  }
  return Mean;
}

/// Of the nearest person.
VMean NearestDistance( const VProjection& i_rProjection, std::span< const VRecordingDetection > i_Detections,
                       std::span< const VRecordingPoint > i_Points, const VAxisTurn& i_rTurn )
{
  VMean Best;
  ForEachPerson( i_Detections,
                 [&]( std::span< const VRecordingDetection > i_Person )
                 {
                   const VMean Mean = PersonDistance( i_rProjection, i_Person, i_Points, i_rTurn );
                   if ( Mean.Count > 0 && ( Best.Count == 0 || Mean.Value() < Best.Value() ) )
                   {
                     Best = Mean;
                   }
                 } );
  return Best;
}

void ForgetPoints( VRecordingCamera& io_rCamera, std::int64_t i_Frame, std::int64_t i_ButOf )
{
  const auto Index = static_cast< std::size_t >( i_Frame );
  for ( std::uint64_t Seen = io_rCamera.DetectionBegin[Index]; Seen < io_rCamera.DetectionBegin[Index + 1]; ++Seen )
  {
    VRecordingDetection& rSeen = io_rCamera.Detections[Seen];
    rSeen.Point = static_cast< std::int64_t >( rSeen.Person ) == i_ButOf ? rSeen.Point : -1;
  }
}
} // namespace

std::string VAxisTurn::Text() const
{
  std::string Text;
  for ( std::size_t Axis = 0; Axis < 3; ++Axis )
  {
    Text.append( Sign[Axis] < 0 ? "-" : "" ).append( 1, static_cast< char >( 'x' + From[Axis] ) );
  }
  return Text;
}

bool VAxisTurn::Parse( const std::string& i_rText, VAxisTurn& o_rTurn )
{
  for ( const VAxisTurn& rTurn : AllTurns() )
  {
    if ( rTurn.Text() == i_rText )
    {
      o_rTurn = rTurn;
      return true;
    }
  }
  return false;
}

bool FindAxisTurn( const VRecording& i_rRecording, VAxisTurn& o_rTurn, double& o_rDistance, double& o_rSecond )
{
  const std::vector< VProjection > Projections = ProjectionsOf( i_rRecording );
  const auto Step = std::max< std::int64_t >( 1, i_rRecording.FrameCount / SampledFrames );
  o_rDistance = o_rSecond = std::numeric_limits< double >::infinity();
  for ( const VAxisTurn& rTurn : AllTurns() )
  {
    VMean All;
    for ( std::size_t Camera = 0; Camera < Projections.size(); ++Camera )
    {
      for ( std::int64_t Frame = 0; Frame < i_rRecording.FrameCount && Projections[Camera].IsUsable(); Frame += Step )
      {
        const VMean Mean = NearestDistance( Projections[Camera], i_rRecording.Cameras[Camera].Frame( Frame ),
                                            i_rRecording.Frame( Frame ), rTurn );
        All.Sum += Mean.Sum;
        All.Count += Mean.Count;
      }
    }
    if ( All.Count > 0 && All.Value() < o_rDistance )
    {
      o_rSecond = o_rDistance;
      o_rDistance = All.Value();
      o_rTurn = rTurn;
    }
    else if ( All.Count > 0 )
    {
      o_rSecond = std::min( o_rSecond, All.Value() );
    }
  }
  if ( !( o_rDistance < FarAway ) )
  {
    o_rTurn = {};
    return false;
  }
  return true;
}

void TurnRecording( const VAxisTurn& i_rTurn, VRecording& io_rRecording )
{
  const auto TurnFloats = [&]( auto& io_rX, auto& io_rY, auto& io_rZ )
  {
    using T = std::remove_reference_t< decltype( io_rX ) >;
    const D3 New = Turned( i_rTurn, static_cast< double >( io_rX ), static_cast< double >( io_rY ),
                           static_cast< double >( io_rZ ) );
    io_rX = static_cast< T >( New.x );
    io_rY = static_cast< T >( New.y );
    io_rZ = static_cast< T >( New.z );
  };
  for ( auto* const pPoints : { &io_rRecording.Points, &io_rRecording.Unlabelled } )
  {
    for ( VRecordingPoint& rPoint : *pPoints )
    {
      TurnFloats( rPoint.x, rPoint.y, rPoint.z );
    }
  }
  for ( VForcePlate& rPlate : io_rRecording.ForcePlates )
  {
    for ( D3& rCorner : rPlate.Corners )
    {
      TurnFloats( rCorner.x, rCorner.y, rCorner.z );
    }
    for ( int Column = 0; Column < 3; ++Column )
    {
      TurnFloats( rPlate.Pose.R[Column], rPlate.Pose.R[3 + Column], rPlate.Pose.R[6 + Column] );
    }
    TurnFloats( rPlate.Pose.T[0], rPlate.Pose.T[1], rPlate.Pose.T[2] );
    for ( auto& rWrench : rPlate.Wrench )
    {
      for ( std::size_t Part = 0; Part < rWrench.size(); Part += 3 )
      {
        TurnFloats( rWrench[Part], rWrench[Part + 1], rWrench[Part + 2] );
      }
    }
  }
  io_rRecording.Bounds = {};
  AddToBounds( io_rRecording.Bounds, io_rRecording.Points );
  AddToBounds( io_rRecording.Bounds, io_rRecording.Unlabelled );
}

void ChoosePersons( VRecording& io_rRecording )
{
  const std::vector< VProjection > Projections = ProjectionsOf( io_rRecording );
  for ( std::size_t Camera = 0; Camera < Projections.size(); ++Camera )
  {
    VRecordingCamera& rCamera = io_rRecording.Cameras[Camera];
    const auto& rHardware = rCamera.Camera.Hardware;
    const double Range = PersonRange * std::hypot( rHardware.SensorWidth, rHardware.SensorHeight );
    const std::int64_t Frames = rCamera.DetectionBegin.empty() ? 0 : io_rRecording.FrameCount;
    for ( std::int64_t Frame = 0; Frame < Frames; ++Frame )
    {
      const auto Detections = rCamera.Frame( Frame );
      std::int64_t Chosen = -1;
      double Least = Range;
      int Persons = 0;
      bool bMeasured = false;
      ForEachPerson( Detections,
                     [&]( std::span< const VRecordingDetection > i_Person )
                     {
                       ++Persons;
                       const VMean Mean =
                           Projections[Camera].IsUsable()
                               ? PersonDistance( Projections[Camera], i_Person, io_rRecording.Frame( Frame ), {} )
                               : VMean();
                       bMeasured = bMeasured || Mean.Count > 0;
                       if ( Mean.Count > 0 && Mean.Value() <= Least )
                       {
                         Least = Mean.Value();
                         Chosen = i_Person.front().Person;
                       }
                     } );
      if ( !bMeasured && Persons == 1 )
      {
        Chosen = Detections.front().Person;
      }
      ForgetPoints( rCamera, Frame, Chosen );
    }
  }
}

void MeasureDistances( VRecording& io_rRecording )
{
  constexpr std::size_t MostInMask = 8;
  const std::vector< VProjection > Projections = ProjectionsOf( io_rRecording );
  const bool bMasks = io_rRecording.CameraMasks.empty() && Projections.size() <= MostInMask;
  if ( bMasks )
  {
    io_rRecording.CameraMasks.resize( io_rRecording.Points.size() );
  }
  for ( std::size_t Camera = 0; Camera < Projections.size(); ++Camera )
  {
    VRecordingCamera& rCamera = io_rRecording.Cameras[Camera];
    double Sum = 0;
    for ( std::int64_t Frame = 0; Frame < io_rRecording.FrameCount; ++Frame )
    {
      const auto Points = io_rRecording.Frame( Frame );
      for ( const VRecordingDetection& rSeen : rCamera.Frame( Frame ) )
      {
        const auto Point = static_cast< std::size_t >( rSeen.Point );
        if ( rSeen.Point < 0 || !Points[Point].IsValid() )
        {
          continue;
        }
        if ( bMasks )
        {
          io_rRecording.CameraMasks[static_cast< std::size_t >( Frame ) * Points.size() + Point] |=
              static_cast< std::uint8_t >( 1u << Camera );
        }
        const D3 Place{ static_cast< double >( Points[Point].x ), static_cast< double >( Points[Point].y ),
                        static_cast< double >( Points[Point].z ) };
        const double Distance = Projections[Camera].IsUsable() && rSeen.Likelihood >= LikelyEnough
                                    ? Projections[Camera].Distance( Place, rSeen )
                                    : std::numeric_limits< double >::infinity();
        if ( std::isfinite( Distance ) )
        {
          Sum += Distance;
          rCamera.WorstDistance = std::max( rCamera.WorstDistance, Distance );
          ++rCamera.MeasuredCount;
        }
      }
    }
    rCamera.MeanDistance = rCamera.MeasuredCount > 0 ? Sum / static_cast< double >( rCamera.MeasuredCount ) : 0;
  }
}

} // namespace HostSources
