#include "WalkerBody.h"

#include <string>

using namespace CoreMoxelTypes;

namespace HostSources::Simulation
{
namespace
{

constexpr D3 Forward{ 1, 0, 0 }, Left{ 0, 1, 0 }, Up{ 0, 0, 1 };
constexpr double HeadBase = 595, ShoulderHeight = 500, ShoulderWidth = 185; // above the hips, of a trunk of 1
constexpr double UpperArmLength = 290, ForearmLength = 250, HandLength = 170;

/// A bone from one place to another, with its z axis as near to `i_rHint` as can be.
VFrame Aimed( const D3& i_rFrom, const D3& i_rTo, const D3& i_rHint )
{
  VFrame Frame;
  Frame.Origin = i_rFrom;
  Frame.X = Unit( i_rTo - i_rFrom );
  Frame.Y = Unit( Cross( i_rHint, Frame.X ) );
  Frame.Z = Cross( Frame.X, Frame.Y );
  return Frame;
}

Rigid Between( const VFrame& i_rFrom, const VFrame& i_rTo )
{
  Rigid Result;
  const D3 Way = i_rTo.Origin - i_rFrom.Origin;
  int Row = 0;
  for ( const D3& rAxis : { i_rFrom.X, i_rFrom.Y, i_rFrom.Z } )
  {
    Result.R[3 * Row] = Dot( rAxis, i_rTo.X );
    Result.R[3 * Row + 1] = Dot( rAxis, i_rTo.Y );
    Result.R[3 * Row + 2] = Dot( rAxis, i_rTo.Z );
    Result.T[Row++] = Dot( rAxis, Way );
  }
  return Result;
}

/// A marker where it is on someone who stands straight; lengths are those of a shape of 1.
struct VMarkerRow
{
  EBone Bone;
  double X, Y, Z;
  double Softness; ///< of what lies between the marker and the bone
};
/// From the hips' middle.
constexpr VMarkerRow TrunkMarkers[] = { { EChest, -69, 0, 563, 0.8 },                                // C7
                                        { EChest, -110, 0, 340, 1 },                                 // T10
                                        { EChest, 66, 0, 502, 0.8 },                                 // CLAV
                                        { EChest, 109, 0, 360, 1 },                                  // STRN
                                        { EChest, -92, 87, 464, 1.3 },                               // LBAK
                                        { EChest, -105, -89, 429, 1.3 }, { EChest, -95, 0, 458, 1 }, // T6
                                        { EHips, 83, 117, 84, 1.4 },                                 // LASI
                                        { EHips, 83, -117, 84, 1.4 },                                // RASI
                                        { EHips, -111, 51, 97, 1 },                                  // LPSI
                                        { EHips, -111, -51, 97, 1 },                                 // RPSI
                                        { EHips, -113, 0, 70, 1 } };                                 // SACR
/// From the neck's top.
constexpr VMarkerRow HeadMarkers[] = { { EHead, 98, 60, 169, 0.4 },   // LFHD
                                       { EHead, 98, -60, 169, 0.4 },  // RFHD
                                       { EHead, -64, 60, 171, 0.4 },  // LBHD
                                       { EHead, -64, -60, 171, 0.4 }, // RBHD
                                       { EHead, 21, 0, 246, 0.4 } };  // ARIEL
/// From the left shoulder; on the right the y axis turns about.
constexpr VMarkerRow ArmMarkers[] = { { ELeftClavicle, -4, 6, 68, 0.8 },     // SHO
                                      { ELeftUpperArm, 14, 61, -143, 1.5 },  // UPA
                                      { ELeftUpperArm, -12, 54, -291, 0.8 }, // ELB
                                      { ELeftUpperArm, -6, -55, -291, 0.8 }, // IEL
                                      { ELeftForearm, 16, 45, -421, 1.2 },   // FRM
                                      { ELeftForearm, 47, 13, -534, 0.6 },   // WRA, on the side of the thumb
                                      { ELeftForearm, -46, 12, -535, 0.6 },  // WRB
                                      { ELeftHand, 6, 39, -629, 0.5 },       // FIN
                                      { ELeftHand, 63, -11, -585, 0.6 } };   // THM
/// From the floor beneath the left hip joint.
constexpr VMarkerRow LegMarkers[] = { { ELeftThigh, 20, 82, 689, 2 },  // THI
                                      { ELeftThigh, -3, 65, 505, 1 },  // KNE
                                      { ELeftThigh, -4, -66, 507, 1 }, // KNEM
                                      { ELeftShin, 18, 51, 300, 1.2 }, // TIB
                                      { ELeftShin, 0, 52, 82, 0.5 },   // ANK
                                      { ELeftShin, -4, -54, 90, 0.5 }, // ANKM
                                      { ELeftFoot, -66, 0, 41, 0 },    // HEE
                                      { ELeftToes, 168, -22, 48, 0 },  // TOE
                                      { ELeftFoot, 107, 62, 33, 0 } }; // MT5

} // namespace

/// Adds the bones parent first, then the markers in the order of their names.
class VBodyBuilder
{
public:
  VBodyBuilder( VWalkerBody& o_rBody, bool i_bFull )
    : m_rBody( o_rBody )
    , m_rShape( o_rBody.m_Shape )
    , m_bFull( i_bFull )
  {
  }

  void AddTrunk()
  {
    const D3 Back = Forward * -1;
    const D3 Hips = Trunk( 0, 0, 0 ), Spine = Trunk( 0, 0, 100 ), Chest = Trunk( -10, 0, 230 );
    const D3 Neck = Trunk( -12, 0, 500 ), Head = OnHead( 0, 0, 0 ), Crown = OnHead( 5, 0, 240 );
    Add( EHips, "Hips", -1, Aimed( Hips, Spine, Back ), Length( Spine - Hips ) );
    i32 Below = Add( ESpine, "Spine", Place( EHips ), Aimed( Spine, Chest, Back ), Length( Chest - Spine ) );
    if ( m_bFull )
    {
      const D3 Middle = ( Spine + Chest ) * 0.5;
      m_rBody.m_Subject.Segments[static_cast< std::size_t >( Below )].BoneLength *= 0.5F;
      Below = Append( "Spine2", Below, EJointType::Ball, Aimed( Middle, Chest, Back ), Length( Chest - Middle ) );
      m_rBody.m_SecondSpine = Below;
    }
    Add( EChest, "Chest", Below, Aimed( Chest, Neck, Back ), Length( Neck - Chest ) );
    Add( ENeck, "Neck", Place( EChest ), Aimed( Neck, Head, Back ), Length( Head - Neck ) );
    Add( EHead, "Head", Place( ENeck ), Aimed( Head, Crown, Back ), Length( Crown - Head ) );
    VFrame End = m_rBody.m_Neutral.back();
    End.Origin = Crown;
    Add( EHeadEnd, "HeadEnd", Place( EHead ), End, 0 );
  }

  void AddArm( int i_Side )
  {
    const char* pSide = i_Side > 0 ? "Left" : "Right";
    const std::uint32_t First = i_Side > 0 ? 0 : ArmBones;
    const auto Named = [&]( const char* i_pName )
    {
      return std::string( pSide ).append( i_pName );
    };
    const D3 Root = Trunk( 10, 25 * i_Side, 485 ), Shoulder = OnArm( i_Side, 0, 0, 0 );
    const D3 Elbow = OnArm( i_Side, 0, 0, -UpperArmLength );
    const D3 Wrist = OnArm( i_Side, 0, 0, -UpperArmLength - ForearmLength );
    const D3 Tip = OnArm( i_Side, 0, 0, -UpperArmLength - ForearmLength - HandLength );
    const D3 Right = Left * -1; // a bent elbow brings the hand forward
    Add( First + ELeftClavicle, Named( "Clavicle" ), Place( EChest ), Aimed( Root, Shoulder, Up ),
         Length( Shoulder - Root ) );
    Add( First + ELeftUpperArm, Named( "UpperArm" ), Place( First + ELeftClavicle ), Aimed( Shoulder, Elbow, Right ),
         Length( Elbow - Shoulder ) );
    Add( First + ELeftForearm, Named( "Forearm" ), Place( First + ELeftUpperArm ), Aimed( Elbow, Wrist, Right ),
         Length( Wrist - Elbow ) );
    Add( First + ELeftHand, Named( "Hand" ), Place( First + ELeftForearm ), Aimed( Wrist, Tip, Right ),
         Length( Tip - Wrist ) );
    if ( m_bFull )
    {
      VFrame End = m_rBody.m_Neutral.back();
      End.Origin = Tip;
      Append( Named( "HandEnd" ), Place( First + ELeftHand ), EJointType::Dummy, End, 0 );
    }
  }

  void AddLeg( int i_Side )
  {
    const char* pSide = i_Side > 0 ? "Left" : "Right";
    const std::uint32_t First = i_Side > 0 ? 0 : LegBones;
    const auto Named = [&]( const char* i_pName )
    {
      return std::string( pSide ).append( i_pName );
    };
    const D3 Hip = OnLeg( i_Side, 0, 0, HipsHeight ), Knee = OnLeg( i_Side, 0, 0, AnkleHeight + ShinLength );
    const D3 Ankle = OnLeg( i_Side, 0, 0, AnkleHeight ), Ball = OnLeg( i_Side, BallToAnkle, 0, ToeJointHeight );
    const D3 Tip = OnLeg( i_Side, BallToAnkle + 65, 0, ToeJointHeight );
    i32 Above = Place( EHips );
    if ( m_bFull )
    {
      const D3 Hips = m_rBody.m_Neutral[EHips].Origin;
      Above = Append( Named( "Pelvis" ), Above, EJointType::Dummy, Aimed( Hips, Hip, Up ), Length( Hip - Hips ) );
    }
    Add( First + ELeftThigh, Named( "Thigh" ), Above, Aimed( Hip, Knee, Left ), Length( Knee - Hip ) );
    Add( First + ELeftShin, Named( "Shin" ), Place( First + ELeftThigh ), Aimed( Knee, Ankle, Left ),
         Length( Ankle - Knee ) );
    // An ankle bends about the knee's axis, then tilts about the foot's length, whichever way the bone points.
    const VFrame Joint{ Ankle, Up, Forward, Left };
    Add( First + ELeftFoot, Named( "Foot" ), Place( First + ELeftShin ), Aimed( Ankle, Ball, Left ),
         Length( Ball - Ankle ), &Joint );
    Add( First + ELeftToes, Named( "Toes" ), Place( First + ELeftFoot ), Aimed( Ball, Tip, Left * -1 ),
         Length( Tip - Ball ) );
    VFrame End = m_rBody.m_Neutral.back();
    End.Origin = Tip;
    Add( First + ELeftToesEnd, Named( "ToesEnd" ), Place( First + ELeftToes ), End, 0 );
    if ( m_bFull )
    {
      const D3 Heel = OnLeg( i_Side, BallToAnkle - BallToHeel, 0, 25 );
      Append( Named( "Heel" ), Place( First + ELeftFoot ), EJointType::Dummy, Aimed( Ankle, Heel, Left ),
              Length( Heel - Ankle ) );
    }
  }

  void AddMarkers()
  {
    for ( const VMarkerRow& rRow : HeadMarkers )
    {
      AddMarker( rRow.Bone, OnHead( rRow.X, rRow.Y, rRow.Z ), rRow.Softness );
    }
    for ( const VMarkerRow& rRow : TrunkMarkers )
    {
      AddMarker( rRow.Bone, Trunk( rRow.X, rRow.Y, rRow.Z ), rRow.Softness );
    }
    for ( const int Side : { 1, -1 } )
    {
      for ( const VMarkerRow& rRow : ArmMarkers )
      {
        AddMarker( rRow.Bone + ( Side > 0 ? 0 : ArmBones ), OnArm( Side, rRow.X, rRow.Y, rRow.Z ), rRow.Softness );
      }
    }
    for ( const int Side : { 1, -1 } )
    {
      for ( const VMarkerRow& rRow : LegMarkers )
      {
        AddMarker( rRow.Bone + ( Side > 0 ? 0 : LegBones ), OnLeg( Side, rRow.X, rRow.Y, rRow.Z ), rRow.Softness );
      }
    }
  }

private:
  D3 Trunk( double i_X, double i_Y, double i_Z ) const
  {
    return { i_X * m_rShape.Breadth, i_Y * m_rShape.Breadth, HipsHeight * m_rShape.Legs + i_Z * m_rShape.Trunk };
  }
  D3 OnHead( double i_X, double i_Y, double i_Z ) const
  {
    return Trunk( 0, 0, HeadBase ) + D3{ i_X, i_Y, i_Z } * m_rShape.Head;
  }
  D3 OnArm( int i_Side, double i_X, double i_Y, double i_Z ) const
  {
    return Trunk( 0, i_Side * ShoulderWidth, ShoulderHeight ) + D3{ i_X, i_Side * i_Y, i_Z } * m_rShape.Arms;
  }
  D3 OnLeg( int i_Side, double i_X, double i_Y, double i_Z ) const
  {
    return D3{ 0, i_Side * HipWidth * m_rShape.Breadth, 0 } + D3{ i_X, i_Side * i_Y, i_Z } * m_rShape.Legs;
  }
  i32 Place( std::uint32_t i_Bone ) const { return static_cast< i32 >( m_rBody.m_Places[i_Bone] ); }

  i32 Add( std::uint32_t i_Bone, const std::string& i_rName, i32 i_Parent, const VFrame& i_rFrame, double i_Length,
           const VFrame* i_pJoint = nullptr )
  {
    m_rBody.m_Places[i_Bone] = static_cast< std::uint32_t >( m_rBody.m_Neutral.size() );
    return Append( i_rName, i_Parent, JointOf( i_Bone ), i_rFrame, i_Length, i_pJoint );
  }
  i32 Append( const std::string& i_rName, i32 i_Parent, EJointType i_Joint, const VFrame& i_rFrame, double i_Length,
              const VFrame* i_pJoint = nullptr )
  {
    VSegment& rSegment = m_rBody.m_Subject.Segments.emplace_back();
    rSegment.Name = i_rName;
    rSegment.Parent = i_Parent;
    rSegment.Joint = i_Joint;
    rSegment.BoneLength = static_cast< f32 >( i_Length );
    const VFrame& rJoint = i_pJoint ? *i_pJoint : i_rFrame;
    rSegment.Pre =
        Between( i_Parent < 0 ? VFrame{} : m_rBody.m_Neutral[static_cast< std::size_t >( i_Parent )], rJoint );
    rSegment.Post = i_pJoint ? Between( rJoint, i_rFrame ) : Rigid{};
    m_rBody.m_Neutral.push_back( i_rFrame );
    return static_cast< i32 >( m_rBody.m_Neutral.size() ) - 1;
  }

  void AddMarker( std::uint32_t i_Bone, const D3& i_rPlace, double i_Softness )
  {
    VSubject& rSubject = m_rBody.m_Subject;
    const auto Index = static_cast< u32 >( rSubject.Markers.size() );
    const std::uint32_t Segment = m_rBody.m_Places[i_Bone];
    VMarker& rMarker = rSubject.Markers.emplace_back();
    rMarker.Id = Index;
    rMarker.Name = WalkerMarkerNames()[Index];
    rMarker.Segment = static_cast< i32 >( Segment );
    const Rigid Way = Between( m_rBody.m_Neutral[Segment], { i_rPlace } );
    rMarker.Local = { Way.T[0], Way.T[1], Way.T[2] };
    rMarker.Radius = 7;
    // Skin slides along a bone more than across it.
    const D3 Sigma = D3{ 1.6, 0.8, 1.1 } * ( 0.5 + i_Softness );
    rMarker.Covariance[0] = Sigma.x * Sigma.x;
    rMarker.Covariance[4] = Sigma.y * Sigma.y;
    rMarker.Covariance[8] = Sigma.z * Sigma.z;
    rSubject.Clusters.emplace_back( Segment, Index );
    VSkinSway& rSway = m_rBody.m_Sways[Index];
    const double Phase = 2 * Pi * VHash( 53 ).With( Index ).Uniform();
    rSway.Amplitude = D3{ 1.1, 0.6, 0.8 } * i_Softness;
    rSway.Sine = std::sin( Phase );
    rSway.Cosine = std::cos( Phase );
  }

  VWalkerBody& m_rBody;
  const VBodyShape& m_rShape;
  const bool m_bFull;
};

VBodyShape ShapeScaled( double i_Scale )
{
  return { i_Scale, i_Scale, i_Scale, i_Scale, i_Scale };
}

VWalkerBody::VWalkerBody( const VBodyShape& i_rShape, EDetail i_Detail )
  : m_Shape( i_rShape )
{
  VBodyBuilder Builder( *this, i_Detail == EDetail::Full );
  Builder.AddTrunk();
  Builder.AddArm( 1 );
  Builder.AddArm( -1 );
  Builder.AddLeg( 1 );
  Builder.AddLeg( -1 );
  Builder.AddMarkers();
  m_pTree = ComputeSubject::VComputeSubjectFK::Build( m_Subject );
}

void VWalkerBody::TakeState( const VWalkerState& i_rState, std::span< double > o_State ) const
{
  for ( std::size_t Bone = 0; Bone < EBones; ++Bone )
  {
    const std::size_t First = m_pTree->FirstDegree( m_Places[Bone] );
    std::copy_n( i_rState.data() + DegreeOf( Bone ), DegreesOf( JointOf( Bone ) ), o_State.data() + First );
  }
  if ( m_SecondSpine >= 0 )
  {
    double* pFirst = o_State.data() + m_pTree->FirstDegree( m_Places[ESpine] );
    double* pSecond = o_State.data() + m_pTree->FirstDegree( static_cast< std::size_t >( m_SecondSpine ) );
    for ( int Axis = 0; Axis < 3; ++Axis )
    {
      pFirst[Axis] *= 0.5;
      pSecond[Axis] = pFirst[Axis];
    }
  }
}

const std::array< const char*, WalkerMarkers >& WalkerMarkerNames()
{
  static constexpr std::array< const char*, WalkerMarkers > Names = {
      "LFHD", "RFHD", "LBHD",  "RBHD", "ARIEL", "C7",    "T10",  "CLAV",  "STRN", "LBAK", "RBAK",
      "T6",   "LASI", "RASI",  "LPSI", "RPSI",  "SACR",  "LSHO", "LUPA",  "LELB", "LIEL", "LFRM",
      "LWRA", "LWRB", "LFIN",  "LTHM", "RSHO",  "RUPA",  "RELB", "RIEL",  "RFRM", "RWRA", "RWRB",
      "RFIN", "RTHM", "LTHI",  "LKNE", "LKNEM", "LTIB",  "LANK", "LANKM", "LHEE", "LTOE", "LMT5",
      "RTHI", "RKNE", "RKNEM", "RTIB", "RANK",  "RANKM", "RHEE", "RTOE",  "RMT5" };
  return Names;
}

std::span< const std::array< std::uint32_t, 2 > > WalkerSticks()
{
  static constexpr std::array< std::uint32_t, 2 > Sticks[] = {
      { 0, 1 },   { 1, 3 },   { 3, 2 },   { 2, 0 },   { 0, 4 },   { 3, 4 },   { 5, 11 },  { 11, 6 },  { 7, 8 },
      { 5, 7 },   { 9, 10 },  { 6, 8 },   { 12, 13 }, { 12, 14 }, { 13, 15 }, { 14, 16 }, { 16, 15 }, { 6, 16 },
      { 7, 17 },  { 5, 17 },  { 17, 18 }, { 18, 19 }, { 19, 20 }, { 19, 21 }, { 21, 22 }, { 22, 23 }, { 22, 24 },
      { 22, 25 }, { 7, 26 },  { 5, 26 },  { 26, 27 }, { 27, 28 }, { 28, 29 }, { 28, 30 }, { 30, 31 }, { 31, 32 },
      { 31, 33 }, { 31, 34 }, { 12, 35 }, { 35, 36 }, { 36, 37 }, { 36, 38 }, { 38, 39 }, { 39, 40 }, { 39, 41 },
      { 39, 42 }, { 42, 43 }, { 41, 43 }, { 13, 44 }, { 44, 45 }, { 45, 46 }, { 45, 47 }, { 47, 48 }, { 48, 49 },
      { 48, 50 }, { 48, 51 }, { 51, 52 }, { 50, 52 } };
  return Sticks;
}

} // namespace HostSources::Simulation
