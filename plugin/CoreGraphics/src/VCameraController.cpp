#include <CoreGraphics/VCameraController.h>

#include <CoreGraphics/VInteractionMapper.h>
#include <CoreGraphics/VRenderContext.h>

#include <QtGui/QMouseEvent>
#include <QtGui/QWheelEvent>

#include <algorithm>
#include <array>
#include <cmath>
#include <limits>

namespace CoreGraphics
{
namespace
{
constexpr float HalfDegree = 0.008726646f; // radians
constexpr float SmallestScale = 0.001f;    // mm per pixel; a scale of 0 would show nothing ever after
constexpr float FitMargin = 250.0f;        // mm
constexpr float Largest = std::numeric_limits< float >::max();

bool Asks( EInteraction i_Action, const QMouseEvent& i_rEvent )
{
  return IsInteraction( i_Action, int( i_rEvent.buttons().toInt() ), int( i_rEvent.modifiers().toInt() ) );
}

QVector3D Turned( const QMatrix4x4& i_rMatrix, const QVector3D& i_rVector )
{
  return i_rMatrix.mapVector( i_rVector );
}

bool IsFinite( const QVector4D& i_rPoint )
{
  return std::isfinite( i_rPoint.x() ) && std::isfinite( i_rPoint.y() ) && std::isfinite( i_rPoint.z() ) &&
         std::isfinite( i_rPoint.w() );
}
} // namespace

const char* ViewTypeName( int i_ViewType )
{
  static constexpr std::array< const char*, ViewTypeCount > Names = { "Perspective", "Front", "Back",  "Left",
                                                                      "Right",       "Top",   "Bottom" };
  return i_ViewType >= 0 && i_ViewType < ViewTypeCount ? Names[std::size_t( i_ViewType )] : "";
}

QMatrix4x4 VCameraController::Rotation() const
{
  struct VTurn
  {
    float Degrees, X, Y;
  };
  static constexpr std::array< VTurn, ViewTypeCount > Turns = {
      { { 0, 0, 0 }, { 0, 0, 1 }, { 180, 0, 1 }, { -90, 0, 1 }, { 90, 0, 1 }, { 90, 1, 0 }, { -90, 1, 0 } } };
  QMatrix4x4 Rotation;
  if ( !IsOrthographic() )
  {
    Rotation.rotate( m_Fields.tilt, 1, 0, 0 );
    Rotation.rotate( m_Fields.azimuth, 0, 0, 1 );
    if ( m_Fields.yUp )
    {
      Rotation.rotate( 90, 1, 0, 0 );
    }
    return Rotation;
  }
  const VTurn& rTurn = Turns[std::size_t( m_Fields.viewType )];
  if ( rTurn.Degrees != 0 )
  {
    Rotation.rotate( rTurn.Degrees, rTurn.X, rTurn.Y, 0 );
  }
  if ( !m_Fields.yUp )
  {
    Rotation.rotate( -90, 1, 0, 0 );
    Rotation.rotate( 180, 0, 0, 1 );
  }
  return Rotation;
}

void VCameraController::Step()
{
  QMatrix4x4 View;
  View.translate( 0, 0, IsOrthographic() ? m_Fields.farPlane * -0.5f : -m_Fields.distance );
  View *= Rotation();
  View.translate( -m_Fields.centre );
  if ( !IsOrthographic() )
  {
    View *= m_Fields.lockPose.inverted();
  }
  m_Fields.view = View;
}

void VCameraController::RebuildProjection()
{
  const auto Width = float( m_Fields.viewportSize.width() );
  const auto Height = float( m_Fields.viewportSize.height() );
  m_Fields.projection.setToIdentity();
  if ( IsOrthographic() )
  {
    const float HalfWidth = Width * m_Fields.orthoScale * 0.5f;
    const float HalfHeight = Height * m_Fields.orthoScale * 0.5f;
    m_Fields.projection.ortho( -HalfWidth, HalfWidth, -HalfHeight, HalfHeight, m_Fields.nearPlane, m_Fields.farPlane );
    return;
  }
  const float Aspect = Width / ( Height == 0.0f ? 1.0f : Height );
  m_Fields.projection.perspective( m_Fields.fieldOfView, Aspect, m_Fields.nearPlane, m_Fields.farPlane );
}

void VCameraController::SetSize( const QSize& i_rSize )
{
  if ( m_Fields.viewportSize != i_rSize )
  {
    m_Fields.viewportSize = i_rSize;
    RebuildProjection();
  }
}

void VCameraController::SetYUp( bool i_bYUp )
{
  m_Fields.yUp = i_bYUp;
}

void VCameraController::SetViewType( int i_ViewType )
{
  if ( i_ViewType >= 0 && i_ViewType < ViewTypeCount )
  {
    m_Fields.viewType = i_ViewType;
    RebuildProjection();
  }
}

void VCameraController::Reset( bool i_bLockedView )
{
  m_Fields.tilt = i_bLockedView ? -90.0f : -60.0f;
  m_Fields.azimuth = i_bLockedView ? 0.0f : 45.0f;
  m_Fields.distance = i_bLockedView ? 1000.0f : 7000.0f;
  m_Fields.orthoScale = 4.0f;
  m_Fields.centre.setX( 0 );
  m_Fields.centre.setZ( 0 );
  m_Fields.lockPose.setToIdentity();
  RebuildProjection();
}

void VCameraController::SetLockPose( const QMatrix4x4& i_rPose )
{
  m_Fields.lockPose = i_rPose;
}

void VCameraController::OnMousePress( const QMouseEvent& i_rEvent, double i_Ratio )
{
  const bool bWasActive = m_Fields.panning || m_Fields.orbiting || m_Fields.zooming;
  const bool bPan = Asks( EInteractionPan, i_rEvent );
  const bool bOrbit = !bPan && !IsOrthographic() && Asks( EInteractionOrbit, i_rEvent );
  const bool bZoom = !bPan && !bOrbit && Asks( EInteractionZoom, i_rEvent );
  if ( ( bPan || bOrbit || bZoom ) && !bWasActive )
  {
    const QPointF Position = i_rEvent.position() * i_Ratio;
    m_Fields.lastPosition = QPoint( int( Position.x() ), int( Position.y() ) );
  }
  m_Fields.panning = bPan;
  m_Fields.orbiting = bOrbit;
  m_Fields.zooming = bZoom;
}

void VCameraController::OnMouseRelease( const QMouseEvent& i_rEvent, double )
{
  m_Fields.panning = Asks( EInteractionPan, i_rEvent );
  m_Fields.orbiting = !m_Fields.panning && !IsOrthographic() && Asks( EInteractionOrbit, i_rEvent );
  m_Fields.zooming = !m_Fields.panning && !m_Fields.orbiting && Asks( EInteractionZoom, i_rEvent );
}

void VCameraController::OnMouseMove( const QMouseEvent& i_rEvent, double i_Ratio )
{
  const QPointF Scaled = i_rEvent.position() * i_Ratio;
  const QPoint Position( int( std::round( Scaled.x() ) ), int( std::round( Scaled.y() ) ) );
  const auto Dx = float( m_Fields.lastPosition.x() - Position.x() );
  const auto Dy = float( m_Fields.lastPosition.y() - Position.y() );
  m_Fields.lastPosition = Position;
  if ( m_Fields.panning )
  {
    const int Height = std::max( m_Fields.viewportSize.height(), 1 );
    const float Scale =
        IsOrthographic() ? m_Fields.orthoScale
                         : 2.0f * std::tan( m_Fields.fieldOfView * HalfDegree ) * m_Fields.distance / float( Height );
    m_Fields.centre += Turned( Rotation().transposed(), QVector3D( Dx, -Dy, 0 ) ) * Scale;
  }
  else if ( m_Fields.orbiting )
  {
    m_Fields.azimuth -= Dx * 0.2f;
    m_Fields.tilt -= Dy * 0.2f;
  }
  else if ( m_Fields.zooming && IsOrthographic() )
  {
    m_Fields.orthoScale = std::max( m_Fields.orthoScale * ( 1.0f - Dy * 0.0025f ), SmallestScale );
    RebuildProjection();
  }
  else if ( m_Fields.zooming )
  {
    m_Fields.distance -= Dy * 15.0f;
  }
}

void VCameraController::OnWheel( const QWheelEvent& i_rEvent )
{
  m_Fields.distance *= i_rEvent.angleDelta().y() >= 0 ? 0.9f : 1.1f;
}

bool VCameraController::OnKeyPress( int i_Key )
{
  if ( i_Key != Qt::Key_Home )
  {
    return false;
  }
  Reset( false );
  return true;
}

void VCameraController::SetFocusPoints( std::span< const QVector4D > i_Points, bool i_bFit )
{
  QVector3D Low( Largest, Largest, Largest );
  QVector3D High = -Low;
  bool bAny = false;
  for ( const QVector4D& rPoint : i_Points )
  {
    if ( !IsFinite( rPoint ) )
    {
      continue;
    }
    bAny = true;
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      Low[Axis] = std::min( Low[Axis], rPoint[Axis] - rPoint.w() );
      High[Axis] = std::max( High[Axis], rPoint[Axis] + rPoint.w() );
    }
  }
  if ( !bAny )
  {
    return;
  }
  m_Fields.centre = ( Low + High ) * 0.5f;
  if ( i_bFit )
  {
    IsOrthographic() ? FitOrthographic( i_Points ) : FitPerspective( i_Points );
  }
}

void VCameraController::FitOrthographic( std::span< const QVector4D > i_Points )
{
  const QMatrix4x4 ToView = Rotation();
  float HalfWidth = 0.0f;
  float HalfHeight = 0.0f;
  for ( const QVector4D& rPoint : i_Points )
  {
    if ( IsFinite( rPoint ) )
    {
      const QVector3D InView = Turned( ToView, rPoint.toVector3D() - m_Fields.centre );
      const float Radius = rPoint.w() + FitMargin;
      HalfWidth = std::max( HalfWidth, std::abs( InView.x() ) + Radius );
      HalfHeight = std::max( HalfHeight, std::abs( InView.y() ) + Radius );
    }
  }
  const auto Width = float( std::max( m_Fields.viewportSize.width(), 1 ) );
  const auto Height = float( std::max( m_Fields.viewportSize.height(), 1 ) );
  m_Fields.orthoScale = std::max( 2.0f * HalfWidth / Width, 2.0f * HalfHeight / Height );
  RebuildProjection();
}

void VCameraController::FitPerspective( std::span< const QVector4D > i_Points )
{
  const auto Width = float( m_Fields.viewportSize.width() );
  const auto Height = float( std::max( m_Fields.viewportSize.height(), 1 ) );
  const float Vertical = m_Fields.fieldOfView * HalfDegree;
  // Beyond a right angle the planes of a very wide view would face away from what they bound.
  const float Horizontal = std::min( Vertical * Width / Height, 89.0f * 2.0f * HalfDegree );
  const std::array< QVector3D, 4 > Inward = { QVector3D( 0, -std::cos( Vertical ), -std::sin( Vertical ) ),
                                              QVector3D( 0, std::cos( Vertical ), -std::sin( Vertical ) ),
                                              QVector3D( -std::cos( Horizontal ), 0, -std::sin( Horizontal ) ),
                                              QVector3D( std::cos( Horizontal ), 0, -std::sin( Horizontal ) ) };
  const QMatrix4x4 ToWorld = Rotation().transposed();
  const QVector3D Forward = ToWorld.column( 2 ).toVector3D();
  float Distance = 0.0f;
  for ( const QVector3D& rInView : Inward )
  {
    const QVector3D Normal = Turned( ToWorld, rInView );
    const float Slope = QVector3D::dotProduct( -Forward, Normal );
    if ( Slope <= 0.0f )
    {
      continue; // a view without width has no side planes
    }
    for ( const QVector4D& rPoint : i_Points )
    {
      if ( IsFinite( rPoint ) )
      {
        const float Along = QVector3D::dotProduct( m_Fields.centre - rPoint.toVector3D(), Normal );
        Distance = std::max( Distance, ( Along + rPoint.w() + FitMargin ) / Slope );
      }
    }
  }
  m_Fields.distance = Distance;
}

void VCameraController::Apply( VRenderContext& io_rContext ) const
{
  io_rContext.SetProjection( m_Fields.projection );
  io_rContext.SetView( m_Fields.view );
  io_rContext.SetViewport( QRect( QPoint( 0, 0 ), m_Fields.viewportSize ) );
  io_rContext.SetFrameSize( m_Fields.viewportSize );
}

} // namespace CoreGraphics
