#include "Walker.h"

#include <algorithm>

namespace HostSources::Simulation
{
namespace
{

constexpr double WalkingHeight = 889; // of the hips' middle, of a body of 1: the knees are never quite straight

/// Axes given in those of the world, seen from a frame.
VFrame Seen( const VFrame& i_rFrom, const VFrame& i_rFrame )
{
  const auto Axis = [&]( const D3& i_rAxis )
  {
    return D3{ Dot( i_rFrom.X, i_rAxis ), Dot( i_rFrom.Y, i_rAxis ), Dot( i_rFrom.Z, i_rAxis ) };
  };
  return { Axis( i_rFrame.Origin - i_rFrom.Origin ), Axis( i_rFrame.X ), Axis( i_rFrame.Y ), Axis( i_rFrame.Z ) };
}

/// Fills a joint state, bone by bone.
class VStateFiller
{
public:
  VStateFiller( const VBodyShape& i_rShape, VWalkerState& o_rState )
    : m_rShape( i_rShape )
    , m_rState( o_rState )
  {
    m_rState.fill( 0 );
  }

  void Bend( std::uint32_t i_Bone, double i_A, double i_B = 0, double i_C = 0 )
  {
    const double Angles[] = { i_A, i_B, i_C };
    std::copy_n( Angles, std::min< std::size_t >( DegreesOf( JointOf( i_Bone ) ), 3 ),
                 m_rState.data() + DegreeOf( i_Bone ) );
  }
  void Bend( std::uint32_t i_Bone, const D3& i_rAngles ) { Bend( i_Bone, i_rAngles.x, i_rAngles.y, i_rAngles.z ); }

  void PutHips( const VFrame& i_rPelvis )
  {
    constexpr VFrame Neutral{ {}, { 0, 0, 1 }, { 0, 1, 0 }, { -1, 0, 0 } };
    Bend( EHips, RotationVector( Neutral, { {}, i_rPelvis.Z, i_rPelvis.Y, i_rPelvis.X * -1 } ) );
    const D3 Moved = i_rPelvis.Origin - D3{ 0, 0, HipsHeight * m_rShape.Legs };
    double* pMoved = m_rState.data() + DegreeOf( EHips ) + 3;
    pMoved[0] = Moved.z;
    pMoved[1] = Moved.y;
    pMoved[2] = -Moved.x;
  }

  /// Brings a foot to its place: six joints for six numbers. The knee bends about the line that is square to the leg
  /// and to the foot, so that the ankle need not turn about the shin.
  void PutLeg( const VFrame& i_rPelvis, const VFrame& i_rFoot, double i_Toes, int i_Side )
  {
    const double Legs = m_rShape.Legs;
    const std::uint32_t First = i_Side > 0 ? 0 : LegBones;
    const D3 Hip = i_rPelvis.Point( 0, i_Side * HipWidth * m_rShape.Breadth, 0 );
    const D3 Way = i_rFoot.Point( -BallToAnkle * Legs, 0, AnkleHeight * Legs ) - Hip;
    constexpr double Straight = ThighLength + ShinLength - 0.01;
    const double Distance = std::clamp( Length( Way ) / Legs, std::abs( ThighLength - ShinLength ) + 1, Straight );
    const D3 Down = Unit( Way );
    const D3 Axis = Unit( Cross( i_rFoot.X, Down ) );
    const auto Angle = [&]( double i_Beside, double i_Other, double i_Opposite )
    {
      return std::acos( ( i_Beside * i_Beside + i_Other * i_Other - i_Opposite * i_Opposite ) /
                        ( 2 * i_Beside * i_Other ) );
    };
    const double AtHip = Angle( ThighLength, Distance, ShinLength );
    const double Knee = Pi - Angle( ThighLength, ShinLength, Distance );
    const auto Turned = [&]( double i_Turn )
    {
      VFrame Bone;
      Bone.X = Down * std::cos( i_Turn ) + Cross( Axis, Down ) * std::sin( i_Turn );
      Bone.Z = Axis;
      Bone.Y = Cross( Bone.Z, Bone.X );
      return Bone;
    };
    const VFrame Thigh = Turned( -AtHip ), Shin = Turned( Knee - AtHip );
    const VFrame Hanging{ {}, i_rPelvis.Z * -1, i_rPelvis.X * -1, i_rPelvis.Y };
    Bend( First + ELeftThigh, RotationVector( Hanging, Thigh ) );
    Bend( First + ELeftShin, Knee );
    // The ankle's axes are up, forward and to the left; its rotation is Rz(a) Ry(b).
    const VFrame Ankle = Seen( { {}, Shin.X * -1, Shin.Y * -1, Shin.Z }, { {}, i_rFoot.Z, i_rFoot.X, i_rFoot.Y } );
    Bend( First + ELeftFoot, std::atan2( -Ankle.Y.x, Ankle.Y.y ), std::atan2( -Ankle.X.z, Ankle.Z.z ) );
    Bend( First + ELeftToes, i_Toes );
  }

  /// `i_Swing` forward, `i_Away` from the body, `i_Elbow` bent.
  void PutArm( int i_Side, double i_Swing, double i_Away, double i_Elbow )
  {
    const std::uint32_t First = i_Side > 0 ? 0 : ArmBones;
    Bend( First + ELeftUpperArm, 0, i_Side * i_Away, i_Swing );
    Bend( First + ELeftForearm, i_Elbow );
  }

private:
  const VBodyShape& m_rShape;
  VWalkerState& m_rState;
};

/// The pelvis over the path: the left foot lands at phase 0; then that hip is forward and the body lowest.
VFrame PelvisAt( const VWalkerStyle& i_rStyle, const VFrame& i_rPath, double i_Stride )
{
  VFrame Pelvis = Yawed( i_rPath, -0.1 * std::cos( i_Stride ) );
  Pelvis.Origin = Pelvis.Point( 0, 18 * std::sin( i_Stride - 0.3 ) * i_rStyle.Scale,
                                ( WalkingHeight - 16 * std::cos( 2 * i_Stride - 0.4 ) ) * i_rStyle.Scale );
  return Pelvis;
}

void FillWalk( const VWalkerStyle& i_rStyle, const VBodyShape& i_rShape, double i_Seconds, VWalkerState& o_rState )
{
  const double Stride = 2 * Pi * ( i_rStyle.Cadence * i_Seconds + i_rStyle.Phase );
  const VFrame Pelvis = PelvisAt( i_rStyle, PathAt( i_rStyle, i_Seconds ), Stride );
  const double Forward = std::cos( Stride ), Aside = std::sin( Stride - 0.3 ), Twice = std::cos( 2 * Stride - 0.4 );

  // The chest turns against the pelvis, the head looks where the way leads, the arms swing against the legs.
  VStateFiller State( i_rShape, o_rState );
  State.PutHips( Pelvis );
  State.Bend( ESpine, 0.11 * Forward, 0.025, 0.02 * Aside );
  State.Bend( EChest, 0.11 * Forward, 0.015 + 0.01 * Twice, 0.02 * Aside );
  State.Bend( ENeck, -0.03 * Aside, 0.03 );
  State.Bend( EHead, -0.12 * Forward, -0.05 - 0.015 * Twice, 0 );
  for ( const int Side : { 1, -1 } )
  {
    const std::uint32_t First = Side > 0 ? 0 : ArmBones;
    const double Swing = -Side * Forward;
    State.PutArm( Side, 0.04 + 0.38 * Swing, 0.13, 0.32 + 0.16 * Swing );
    State.Bend( First + ELeftClavicle, ( 4 + 5 * Swing ) * i_rShape.Trunk );
    State.Bend( First + ELeftHand, 0.12 + 0.1 * std::sin( Stride + ( Side > 0 ? 0.6 : 0.6 + Pi ) ), -0.05 * Side );
    const VWalkerFoot Foot = FootAt( i_rStyle, i_Seconds, Side );
    State.PutLeg( Pelvis, Foot.Frame, Foot.Toes, Side );
  }
}

void PutFeet( const VBodyShape& i_rShape, const VFrame& i_rPelvis, double i_Apart, VStateFiller& io_rState )
{
  io_rState.PutHips( i_rPelvis );
  for ( const int Side : { 1, -1 } )
  {
    VFrame Foot;
    Foot.Origin = { BallToAnkle * i_rShape.Legs, Side * ( HipWidth * i_rShape.Breadth + i_Apart ), 0 };
    io_rState.PutLeg( i_rPelvis, Foot, 0, Side );
  }
}

} // namespace

void PoseWalker( const VWalkerStyle& i_rStyle, const VWalkerBody& i_rBody, double i_Seconds, VWalkerPose& o_rPose )
{
  FillWalk( i_rStyle, i_rBody.Shape(), i_Seconds, o_rPose.State );
  (void)i_rBody.Tree().Pose( o_rPose.State, 1, o_rPose.Segments ); // the sizes are those of the tree
  const double Turn = 4 * Pi * ( i_rStyle.Cadence * i_Seconds + i_rStyle.Phase );
  const double Sine = std::sin( Turn ), Cosine = std::cos( Turn );
  const auto& rMarkers = i_rBody.Subject().Markers;
  for ( std::size_t Index = 0; Index < WalkerMarkers; ++Index )
  {
    const CoreMoxelTypes::VMarker& rMarker = rMarkers[Index];
    const VSkinSway& rSway = i_rBody.Sways()[Index];
    const D3 Moved = rMarker.Local + rSway.Amplitude * ( Sine * rSway.Cosine + Cosine * rSway.Sine );
    const auto& rBone = o_rPose.Segments[static_cast< std::size_t >( rMarker.Segment )];
    o_rPose.Solved[Index] = Placed( rBone, rMarker.Local );
    o_rPose.Markers[Index] = Placed( rBone, Moved );
  }
}

std::vector< VNamedPose > NamedPoses( const VWalkerBody& i_rBody )
{
  const VBodyShape& rShape = i_rBody.Shape();
  std::vector< VNamedPose > Poses;
  const auto Add = [&]( const char* i_pName, auto&& i_Fill )
  {
    VNamedPose& rPose = Poses.emplace_back();
    rPose.Name = i_pName;
    VStateFiller State( rShape, rPose.State );
    i_Fill( State, rPose.State );
  };
  Add( "Neutral", []( VStateFiller&, VWalkerState& ) {} );
  Add( "T-pose",
       []( VStateFiller& io_rState, VWalkerState& )
       {
         io_rState.PutArm( 1, 0, Pi / 2, 0 );
         io_rState.PutArm( -1, 0, Pi / 2, 0 );
       } );
  Add( "Walk",
       [&]( VStateFiller& io_rState, VWalkerState& o_rState )
       {
         VWalkerStyle Style;
         Style.Scale = rShape.Legs;
         FillWalk( Style, rShape, 0.05, o_rState );
         const VFrame Path = PathAt( Style, 0.05 );
         io_rState.PutHips( Seen( Path, PelvisAt( Style, Path, 2 * Pi * Style.Cadence * 0.05 ) ) );
       } );
  Add( "Reach",
       [&]( VStateFiller& io_rState, VWalkerState& )
       {
         VFrame Pelvis = Pitched( Yawed( {}, 0.15 ), 0.1 );
         Pelvis.Origin = { 20 * rShape.Legs, 0, ( HipsHeight - 25 ) * rShape.Legs };
         PutFeet( rShape, Pelvis, 0, io_rState );
         io_rState.Bend( ESpine, 0.2, 0.08, 0.05 );
         io_rState.Bend( EChest, 0.2, 0.05, 0.05 );
         io_rState.Bend( EHead, 0.1, -0.35, 0 );
         io_rState.Bend( ERightClavicle, 35 * rShape.Trunk );
         io_rState.PutArm( -1, 2.5, 0.25, 0.2 );
         io_rState.PutArm( 1, -0.35, 0.25, 0.5 );
       } );
  Add( "Crouch",
       [&]( VStateFiller& io_rState, VWalkerState& )
       {
         VFrame Pelvis = Pitched( {}, 0.45 );
         Pelvis.Origin = { -130 * rShape.Legs, 0, 0.56 * HipsHeight * rShape.Legs };
         PutFeet( rShape, Pelvis, 0, io_rState );
         io_rState.Bend( ESpine, 0, 0.15, 0 );
         io_rState.Bend( EChest, 0, 0.1, 0 );
         io_rState.Bend( EHead, 0, -0.5, 0 );
         io_rState.PutArm( 1, 1.5, 0.1, 0.3 );
         io_rState.PutArm( -1, 1.5, 0.1, 0.3 );
       } );
  return Poses;
}

VWalkerState SpreadState( const VWalkerBody& i_rBody )
{
  const VBodyShape& rShape = i_rBody.Shape();
  VWalkerState Result;
  VStateFiller State( rShape, Result );
  VFrame Pelvis;
  Pelvis.Origin.z = ( HipsHeight - 15 ) * rShape.Legs;
  PutFeet( rShape, Pelvis, 110 * rShape.Legs, State );
  State.PutArm( 1, 0, 1.1, 0.1 );
  State.PutArm( -1, 0, 1.1, 0.1 );
  return Result;
}

} // namespace HostSources::Simulation
