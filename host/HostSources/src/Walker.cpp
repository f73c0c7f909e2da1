#include "Walker.h"

#include <algorithm>

namespace HostSources::Simulation
{
namespace
{

// Lengths of a body of 1.75 m, mm.
constexpr double Thigh = 430, Shin = 425, UpperArm = 290, Forearm = 250;
constexpr double HipHeight = 905, HipWidth = 90, AnkleHeight = 80, BallToAnkle = 130, BallToHeel = 175;
constexpr double StanceShare = 0.6; // of a stride, during which a foot is down

/// One foot in its stride.
struct VFoot
{
  VFrame Frame; ///< at the ball, pitched
  double Stride = 0;
};

/// The body's place over the floor when it has walked for that long.
VFrame PathAt( const VWalkerStyle& i_rStyle, double i_Seconds )
{
  const double Angle = i_rStyle.Start + i_rStyle.Direction * i_Seconds * i_rStyle.Speed / i_rStyle.Radius;
  const double C = std::cos( Angle ), S = std::sin( Angle );
  const D3 Forward{ -S * i_rStyle.Direction, C * i_rStyle.Direction, 0 };
  return { { C * i_rStyle.Radius, S * i_rStyle.Radius, 0 }, Forward, { -Forward.y, Forward.x, 0 }, { 0, 0, 1 } };
}

double Smooth( double i_Share )
{
  const double T = std::clamp( i_Share, 0.0, 1.0 );
  return T * T * ( 3 - 2 * T );
}

/// Nose-down angle of the sole: it lands on the heel, lies flat, and leaves from the ball.
double SolePitch( double i_Stride )
{
  constexpr double Landing = -0.28, Leaving = 0.75;
  if ( i_Stride < StanceShare )
  {
    return Landing * ( 1 - Smooth( i_Stride / 0.1 ) ) +
           Leaving * Smooth( ( i_Stride - 0.36 ) / ( StanceShare - 0.36 ) );
  }
  return Leaving + ( Landing - Leaving ) * Smooth( ( i_Stride - StanceShare ) / ( 0.9 - StanceShare ) );
}

VFoot FootAt( const VWalkerStyle& i_rStyle, double i_Seconds, int i_Side )
{
  const double Offset = i_Side > 0 ? 0.0 : 0.5;
  const double Strides = i_rStyle.Cadence * i_Seconds + i_rStyle.Phase + Offset;
  const double Whole = std::floor( Strides );
  VFoot Foot;
  Foot.Stride = Strides - Whole;
  // Where the sole stands in a stride: beside the path, where the body is in the middle of the stance.
  const auto Plant = [&]( double i_Stride )
  {
    const double Middle = ( i_Stride + StanceShare / 2 - i_rStyle.Phase - Offset ) / i_rStyle.Cadence;
    VFrame Frame = PathAt( i_rStyle, Middle );
    Frame.Origin = Frame.Point( 55 * i_rStyle.Scale, i_Side * 85 * i_rStyle.Scale, 0 );
    return Yawed( Frame, i_Side * 0.12 );
  };
  Foot.Frame = Plant( Whole );
  double Lift = 0;
  if ( Foot.Stride > StanceShare )
  {
    const double Share = ( Foot.Stride - StanceShare ) / ( 1 - StanceShare );
    const VFrame Next = Plant( Whole + 1 );
    const double Way = Smooth( Share );
    Foot.Frame.Origin = Foot.Frame.Origin * ( 1 - Way ) + Next.Origin * Way;
    Foot.Frame.X = Unit( Foot.Frame.X * ( 1 - Way ) + Next.X * Way );
    Foot.Frame.Y = Cross( Foot.Frame.Z, Foot.Frame.X );
    Lift = 55 * std::sin( Pi * Share );
  }
  const double Pitch = SolePitch( Foot.Stride );
  const double HeelFirst = std::max( 0.0, -std::sin( Pitch ) * BallToHeel );
  Foot.Frame.Origin.z = ( Lift + HeelFirst ) * i_rStyle.Scale;
  Foot.Frame = Pitched( Foot.Frame, Pitch );
  return Foot;
}

VFootLoad LoadOf( const VWalkerStyle& i_rStyle, const VFoot& i_rFoot )
{
  VFootLoad Load;
  Load.bDown = i_rFoot.Stride < StanceShare;
  if ( Load.bDown )
  {
    const double Share = i_rFoot.Stride / StanceShare;
    const double Weight = i_rStyle.MassKg * 9.81;
    const D3 Forward = Unit( { i_rFoot.Frame.X.x, i_rFoot.Frame.X.y, 0 } );
    Load.Centre = i_rFoot.Frame.Origin + Forward * ( ( -BallToHeel + 215 * Share ) * i_rStyle.Scale );
    Load.Centre.z = 0;
    // Braking first, then pushing off; two humps with a trough between them.
    Load.Force = Forward * ( -0.18 * Weight * std::sin( 2 * Pi * Share ) );
    Load.Force.z = Weight * ( 1.25 * std::sin( Pi * Share ) + 0.3 * std::sin( 3 * Pi * Share ) );
  }
  return Load;
}

/// The middle joint of a limb of two bones, bent towards `i_rBend`.
D3 MiddleJoint( const D3& i_rRoot, const D3& i_rEnd, double i_First, double i_Second, const D3& i_rBend )
{
  const D3 Way = i_rEnd - i_rRoot;
  const double Distance = std::clamp( Length( Way ), std::abs( i_First - i_Second ) + 1, i_First + i_Second - 0.5 );
  const D3 Along = Unit( Way );
  const double Foot = ( i_First * i_First - i_Second * i_Second + Distance * Distance ) / ( 2 * Distance );
  const double Height = std::sqrt( std::max( 0.0, i_First * i_First - Foot * Foot ) );
  const D3 Across = Unit( i_rBend - Along * Dot( i_rBend, Along ) );
  return i_rRoot + Along * Foot + Across * Height;
}

/// Writes markers one after the other, in the order of the names.
class VWriter
{
public:
  VWriter( D3* o_pMarkers, double i_Scale )
    : m_pNext( o_pMarkers )
    , m_Scale( i_Scale )
  {
  }
  void Put( const D3& i_rPoint ) { *m_pNext++ = i_rPoint; }
  void Put( const VFrame& i_rFrame, double i_X, double i_Y, double i_Z )
  {
    Put( i_rFrame.Point( i_X * m_Scale, i_Y * m_Scale, i_Z * m_Scale ) );
  }

private:
  D3* m_pNext;
  double m_Scale;
};

void PutTrunk( VWriter& o_rWriter, const VFrame& i_rPelvis, const VFrame& i_rChest )
{
  VFrame Head = i_rChest;
  Head.Origin = i_rChest.Point( 0, 0, 0 );
  for ( const double X : { 85.0, -75.0 } ) // LFHD RFHD LBHD RBHD, then the crown
  {
    o_rWriter.Put( Head, X + 25, 70, 485 );
    o_rWriter.Put( Head, X + 25, -70, 485 );
  }
  o_rWriter.Put( Head, 20, 0, 550 );
  o_rWriter.Put( i_rChest, -60, 0, 290 );   // C7
  o_rWriter.Put( i_rChest, -115, 0, 40 );   // T10
  o_rWriter.Put( i_rChest, 75, 0, 230 );    // CLAV
  o_rWriter.Put( i_rChest, 115, 0, 60 );    // STRN
  o_rWriter.Put( i_rChest, -115, 90, 170 ); // LBAK
  o_rWriter.Put( i_rChest, -115, -90, 130 );
  o_rWriter.Put( i_rChest, -110, 0, 160 ); // T6
  o_rWriter.Put( i_rPelvis, 95, 125, 85 ); // LASI
  o_rWriter.Put( i_rPelvis, 95, -125, 85 );
  o_rWriter.Put( i_rPelvis, -100, 50, 95 ); // LPSI
  o_rWriter.Put( i_rPelvis, -100, -50, 95 );
  o_rWriter.Put( i_rPelvis, -110, 0, 70 ); // SACR
}

void PutArm( VWriter& o_rWriter, const VFrame& i_rChest, int i_Side, double i_Swing, double i_Scale )
{
  const double Out = i_Side;
  VFrame Upper = Pitched( i_rChest, -i_Swing * 0.38 - 0.04 );
  Upper.Origin = i_rChest.Point( 0, Out * 185 * i_Scale, 205 * i_Scale );
  Upper.Z = Unit( Upper.Z - Upper.Y * ( Out * 0.13 ) ); // the arms hang a little away from the body
  const D3 Elbow = Upper.Point( 0, 0, -UpperArm * i_Scale );
  VFrame Lower = Pitched( Upper, -0.32 - 0.16 * i_Swing );
  Lower.Origin = Elbow;
  const D3 Wrist = Lower.Point( 0, 0, -Forearm * i_Scale );
  VFrame Hand = Lower;
  Hand.Origin = Wrist;

  o_rWriter.Put( Upper, 0, Out * 5, 50 );     // SHO
  o_rWriter.Put( Upper, 10, Out * 50, -140 ); // UPA
  o_rWriter.Put( Lower, -10, Out * 45, 0 );   // ELB
  o_rWriter.Put( Lower, -5, Out * -45, 0 );   // IEL
  o_rWriter.Put( Lower, 15, Out * 40, -130 ); // FRM
  o_rWriter.Put( Hand, 35, Out * 10, 0 );     // WRA, on the side of the thumb
  o_rWriter.Put( Hand, -35, Out * 10, 0 );    // WRB
  o_rWriter.Put( Hand, 5, Out * 25, -90 );    // FIN
  o_rWriter.Put( Hand, 50, Out * -5, -50 );   // THM
}

void PutLeg( VWriter& o_rWriter, const VFrame& i_rPelvis, const VFoot& i_rFoot, int i_Side, double i_Scale )
{
  const double Out = i_Side;
  const D3 Hip = i_rPelvis.Point( 0, Out * HipWidth * i_Scale, 0 );
  const VFrame& rFoot = i_rFoot.Frame;
  const D3 Ankle = rFoot.Point( -BallToAnkle * i_Scale, 0, AnkleHeight * i_Scale );
  const D3 Bend = i_rPelvis.X + i_rPelvis.Y * ( Out * 0.08 );
  const D3 Knee = MiddleJoint( Hip, Ankle, Thigh * i_Scale, Shin * i_Scale, Bend );
  const auto Limb = [&]( const D3& i_rTop, const D3& i_rBottom )
  {
    VFrame Frame;
    Frame.Origin = i_rBottom;
    Frame.Z = Unit( i_rTop - i_rBottom );
    Frame.Y = Unit( Cross( Frame.Z, i_rPelvis.X ) );
    Frame.X = Cross( Frame.Y, Frame.Z );
    return Frame;
  };
  const VFrame Upper = Limb( Hip, Knee );
  const VFrame Lower = Limb( Knee, Ankle );

  o_rWriter.Put( Upper, 20, Out * 80, 190 ); // THI
  o_rWriter.Put( Upper, 0, Out * 55, 5 );    // KNE
  o_rWriter.Put( Upper, 0, Out * -55, 5 );   // KNEM
  o_rWriter.Put( Lower, 20, Out * 55, 220 ); // TIB
  o_rWriter.Put( Lower, 0, Out * 38, 0 );    // ANK
  o_rWriter.Put( Lower, 0, Out * -38, 5 );   // ANKM
  o_rWriter.Put( rFoot, -BallToHeel - 10, 0, 40 );
  o_rWriter.Put( rFoot, 35, Out * -15, 35 ); // TOE
  o_rWriter.Put( rFoot, -20, Out * 45, 25 ); // MT5
}

} // namespace

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

void LoadFeet( const VWalkerStyle& i_rStyle, double i_Seconds, std::array< VFootLoad, 2 >& o_rFeet )
{
  o_rFeet = { LoadOf( i_rStyle, FootAt( i_rStyle, i_Seconds, 1 ) ),
              LoadOf( i_rStyle, FootAt( i_rStyle, i_Seconds, -1 ) ) };
}

void PoseWalker( const VWalkerStyle& i_rStyle, double i_Seconds, VWalkerPose& o_rPose )
{
  const double Scale = i_rStyle.Scale;
  const double Stride = 2 * Pi * ( i_rStyle.Cadence * i_Seconds + i_rStyle.Phase );
  const VFoot Left = FootAt( i_rStyle, i_Seconds, 1 );
  const VFoot Right = FootAt( i_rStyle, i_Seconds, -1 );
  o_rPose.Feet = { LoadOf( i_rStyle, Left ), LoadOf( i_rStyle, Right ) };

  // The left foot lands at phase 0: then that hip is forward, the left arm back, the body lowest.
  const double Forward = std::cos( Stride );
  VFrame Pelvis = Yawed( PathAt( i_rStyle, i_Seconds ), -0.1 * Forward );
  Pelvis.Origin = Pelvis.Point( 0, 18 * std::sin( Stride - 0.3 ) * Scale,
                                ( HipHeight - 16 * std::cos( 2 * Stride - 0.4 ) ) * Scale );
  VFrame Chest = Pitched( Yawed( Pelvis, 0.22 * Forward ), 0.04 );
  Chest.Origin = Pelvis.Point( 8 * Scale, 0, 300 * Scale );

  VWriter Writer( o_rPose.Markers.data(), Scale );
  PutTrunk( Writer, Pelvis, Chest );
  PutArm( Writer, Chest, 1, -Forward, Scale );
  PutArm( Writer, Chest, -1, Forward, Scale );
  PutLeg( Writer, Pelvis, Left, 1, Scale );
  PutLeg( Writer, Pelvis, Right, -1, Scale );
}

} // namespace HostSources::Simulation
