#include <HostSources/PerformerMesh.h>

#include "SimulatedSubjects.h"
#include "SurfaceNet.h"

#include <algorithm>
#include <limits>

using namespace CoreMoxelTypes;

namespace HostSources
{
namespace
{

using namespace Simulation;

constexpr double Cell = 27, Margin = 40; // mm
constexpr double Melting = 34;           // how near, in mm, flesh has to be to flow together
constexpr double Softness = 17;          // over how many mm the hold of a bone falls to a third

/// Whose proportions a piece of flesh follows.
enum class EPart
{
  Trunk,
  Head,
  Arm,
  Leg
};

/// A round piece of flesh from one place to another, held by a bone. Places are told in the bone's body as it stands
/// straight, from the bone's start: forward, outward on the bone's side (left, of bones in the middle), up.
struct VFlesh
{
  EBone Bone;
  EPart Part;
  D3 From;
  double FromRadius;
  D3 To;
  double ToRadius;
};

constexpr VFlesh TrunkFlesh[] = {
    { EHips, EPart::Trunk, { -12, 62, 5 }, 98, { -12, 45, 60 }, 92 },    // of both sides, as all with a y
    { EHips, EPart::Trunk, { -38, 55, -35 }, 78, { -35, 50, 0 }, 80 },   // seat
    { ESpine, EPart::Trunk, { 4, 44, -20 }, 95, { 4, 44, 110 }, 98 },    // waist
    { EChest, EPart::Trunk, { 8, 44, 0 }, 104, { 10, 60, 150 }, 109 },   // ribs
    { EChest, EPart::Trunk, { 4, 45, 200 }, 82, { 4, 105, 215 }, 66 },   // shoulder blades
    { EChest, EPart::Trunk, { -5, 25, 255 }, 55, { -5, 110, 235 }, 46 }, // neck to shoulder
    { ENeck, EPart::Trunk, { 0, 0, -10 }, 56, { 10, 0, 95 }, 54 },
    { EHead, EPart::Head, { 38, 0, 45 }, 52, { 30, 0, 95 }, 66 },       // jaw
    { EHead, EPart::Head, { 8, 0, 150 }, 88, { 36, 0, 142 }, 82 },      // skull
    { EHead, EPart::Head, { 112, 0, 100 }, 15, { 105, 0, 128 }, 11 } }; // nose
constexpr VFlesh ArmFlesh[] = { { ELeftClavicle, EPart::Trunk, { -5, 60, 0 }, 52, { -8, 140, 12 }, 58 },
                                { ELeftUpperArm, EPart::Arm, { 0, 4, 0 }, 57, { 0, 6, -120 }, 46 },
                                { ELeftUpperArm, EPart::Arm, { 2, 0, -120 }, 45, { 0, 0, -285 }, 38 },
                                { ELeftForearm, EPart::Arm, { 0, 0, 0 }, 39, { 0, 4, -80 }, 40 },
                                { ELeftForearm, EPart::Arm, { 0, 4, -80 }, 39, { 0, 0, -245 }, 28 },
                                { ELeftHand, EPart::Arm, { 14, 0, -15 }, 24, { 20, -2, -85 }, 22 },
                                { ELeftHand, EPart::Arm, { -14, 0, -15 }, 24, { -20, -2, -85 }, 21 },
                                { ELeftHand, EPart::Arm, { 14, -4, -90 }, 21, { 10, -14, -165 }, 16 },
                                { ELeftHand, EPart::Arm, { -14, -4, -90 }, 21, { -8, -14, -158 }, 15 },
                                { ELeftHand, EPart::Arm, { 24, 0, -30 }, 19, { 52, -12, -95 }, 16 } }; // thumb
constexpr VFlesh LegFlesh[] = { { ELeftThigh, EPart::Leg, { 0, 10, -20 }, 90, { 4, 2, -200 }, 70 },
                                { ELeftThigh, EPart::Leg, { 4, 2, -200 }, 70, { 6, 0, -410 }, 50 },
                                { ELeftShin, EPart::Leg, { 6, 0, -10 }, 50, { 0, 0, -100 }, 47 },
                                { ELeftShin, EPart::Leg, { -16, 2, -90 }, 45, { -14, 0, -210 }, 41 }, // calf
                                { ELeftShin, EPart::Leg, { 4, 0, -100 }, 43, { 0, 0, -400 }, 32 },
                                { ELeftFoot, EPart::Leg, { -20, 0, -45 }, 34, { 0, 0, 0 }, 36 }, // heel
                                { ELeftFoot, EPart::Leg, { -5, 0, -30 }, 40, { 105, -6, -52 }, 28 },
                                { ELeftFoot, EPart::Leg, { 20, 12, -52 }, 28, { 112, 22, -58 }, 24 },
                                { ELeftToes, EPart::Leg, { -12, -14, 6 }, 26, { 58, -12, 0 }, 19 },
                                { ELeftToes, EPart::Leg, { -16, 20, 4 }, 24, { 38, 20, -1 }, 17 } };

struct VPiece
{
  std::uint32_t Bone;
  D3 From, Way;
  double FromRadius, ToRadius, Inverse; ///< of the way's length squared

  double Distance( const D3& i_rPoint ) const
  {
    const D3 Off = i_rPoint - From;
    const double Along = std::clamp( Dot( Off, Way ) * Inverse, 0.0, 1.0 );
    return Length( Off - Way * Along ) - FromRadius - ( ToRadius - FromRadius ) * Along;
  }
};

/// The lesser of two distances, rounded where both are near.
double Melted( double i_A, double i_B )
{
  const double Near = std::max( Melting - std::abs( i_A - i_B ), 0.0 ) / Melting;
  return std::min( i_A, i_B ) - Near * Near * Melting * 0.25;
}

class VSculptor
{
public:
  explicit VSculptor( const VWalkerBody& i_rBody )
    : m_rBody( i_rBody )
    , m_Bind( EBones )
  {
    (void)i_rBody.Tree().Pose( SpreadState( i_rBody ), 1, m_Bind ); // the sizes are those of the tree
    for ( const VFlesh& rFlesh : TrunkFlesh )
    {
      Add( rFlesh, rFlesh.Bone, 1 );
      if ( rFlesh.From.y != 0 || rFlesh.To.y != 0 )
      {
        Add( rFlesh, rFlesh.Bone, -1 );
      }
    }
    for ( const int Side : { 1, -1 } )
    {
      for ( const VFlesh& rFlesh : ArmFlesh )
      {
        Add( rFlesh, rFlesh.Bone + ( Side > 0 ? 0 : ArmBones ), Side );
      }
      for ( const VFlesh& rFlesh : LegFlesh )
      {
        Add( rFlesh, rFlesh.Bone + ( Side > 0 ? 0 : LegBones ), Side );
      }
    }
  }

  VPerformerMesh Make() const
  {
    D3 Least = m_Pieces.front().From, Most = Least;
    for ( const VPiece& rPiece : m_Pieces )
    {
      const double Radius = std::max( rPiece.FromRadius, rPiece.ToRadius ) + Margin;
      for ( const D3& rEnd : { rPiece.From, rPiece.From + rPiece.Way } )
      {
        Least = { std::min( Least.x, rEnd.x - Radius ), std::min( Least.y, rEnd.y - Radius ),
                  std::min( Least.z, rEnd.z - Radius ) };
        Most = { std::max( Most.x, rEnd.x + Radius ), std::max( Most.y, rEnd.y + Radius ),
                 std::max( Most.z, rEnd.z + Radius ) };
      }
    }
    VSurface Surface = SurfaceOf(
        [this]( const D3& i_rPoint )
        {
          return Field( i_rPoint );
        },
        Least, Most, Cell );
    VPerformerMesh Mesh;
    for ( std::size_t Bone = 0; Bone < EBones; ++Bone )
    {
      Mesh.Bones.push_back( { m_rBody.Subject().Segments[Bone].Name, Inverse( m_Bind[Bone] ) } );
    }
    const auto AsFloats = []( const D3& i_rPoint )
    {
      return std::array< float, 3 >{ static_cast< float >( i_rPoint.x ), static_cast< float >( i_rPoint.y ),
                                     static_cast< float >( i_rPoint.z ) };
    };
    for ( std::size_t Vertex = 0; Vertex < Surface.Positions.size(); ++Vertex )
    {
      Mesh.Positions.push_back( AsFloats( Surface.Positions[Vertex] ) );
      Mesh.Normals.push_back( AsFloats( Surface.Normals[Vertex] ) );
      Mesh.Influences.push_back( HoldOf( Surface.Positions[Vertex] ) );
    }
    Mesh.Triangles = std::move( Surface.Triangles );
    return Mesh;
  }

private:
  static Rigid Inverse( const ComputeSubject::VRigidTransform& i_rPose )
  {
    Rigid Result;
    for ( int Row = 0; Row < 3; ++Row )
    {
      Result.T[Row] = 0;
      for ( int Column = 0; Column < 3; ++Column )
      {
        Result.R[3 * Row + Column] = i_rPose.m_Rotation[3 * Column + Row];
        Result.T[Row] -= i_rPose.m_Rotation[3 * Column + Row] * i_rPose.m_Translation[Column];
      }
    }
    return Result;
  }

  void Add( const VFlesh& i_rFlesh, std::uint32_t i_Bone, int i_Side )
  {
    const VBodyShape& rShape = m_rBody.Shape();
    const double Limb = i_rFlesh.Part == EPart::Head  ? rShape.Head
                        : i_rFlesh.Part == EPart::Arm ? rShape.Arms
                                                      : rShape.Legs;
    const bool bTrunk = i_rFlesh.Part == EPart::Trunk;
    const D3 Scale = bTrunk ? D3{ rShape.Breadth, rShape.Breadth, rShape.Trunk } : D3{ Limb, Limb, Limb };
    const double Thickness = bTrunk ? rShape.Breadth : Limb;
    const VFrame& rNeutral = m_rBody.Neutral()[i_Bone];
    const auto Place = [&]( const D3& i_rFrom )
    {
      const D3 Off{ i_rFrom.x * Scale.x, i_Side * i_rFrom.y * Scale.y, i_rFrom.z * Scale.z };
      return Placed( m_Bind[i_Bone], { Dot( rNeutral.X, Off ), Dot( rNeutral.Y, Off ), Dot( rNeutral.Z, Off ) } );
    };
    VPiece& rPiece = m_Pieces.emplace_back();
    rPiece.Bone = i_Bone;
    rPiece.From = Place( i_rFlesh.From );
    rPiece.Way = Place( i_rFlesh.To ) - rPiece.From;
    rPiece.Inverse = 1 / Dot( rPiece.Way, rPiece.Way );
    rPiece.FromRadius = i_rFlesh.FromRadius * Thickness;
    rPiece.ToRadius = i_rFlesh.ToRadius * Thickness;
  }

  double Field( const D3& i_rPoint ) const
  {
    double Distance = 1000;
    for ( const VPiece& rPiece : m_Pieces )
    {
      Distance = Melted( Distance, rPiece.Distance( i_rPoint ) );
    }
    return std::max( Distance, -i_rPoint.z ); // soles are flat
  }

  /// The four bones whose flesh is nearest.
  VPerformerMesh::VInfluence HoldOf( const D3& i_rPoint ) const
  {
    std::array< double, EBones > Distances;
    Distances.fill( std::numeric_limits< double >::max() );
    for ( const VPiece& rPiece : m_Pieces )
    {
      Distances[rPiece.Bone] = std::min( Distances[rPiece.Bone], rPiece.Distance( i_rPoint ) );
    }
    std::array< std::uint16_t, EBones > Order;
    for ( std::uint16_t Bone = 0; Bone < EBones; ++Bone )
    {
      Order[Bone] = Bone;
    }
    std::partial_sort( Order.begin(), Order.begin() + 4, Order.end(),
                       [&]( std::uint16_t i_A, std::uint16_t i_B )
                       {
                         return Distances[i_A] < Distances[i_B];
                       } );
    VPerformerMesh::VInfluence Hold;
    std::array< double, 4 > Weights;
    double Sum = 0;
    for ( std::size_t Place = 0; Place < 4; ++Place )
    {
      const double Farther = Distances[Order[Place]] - Distances[Order[0]];
      Weights[Place] = Farther < 4 * Softness ? std::exp( -Farther / Softness ) : 0;
      Sum += Weights[Place];
    }
    for ( std::size_t Place = 0; Place < 4; ++Place )
    {
      Hold.Bones[Place] = Weights[Place] > 0 ? Order[Place] : 0;
      Hold.Weights[Place] = static_cast< float >( Weights[Place] / Sum );
    }
    return Hold;
  }

  const VWalkerBody& m_rBody;
  std::vector< ComputeSubject::VRigidTransform > m_Bind;
  std::vector< VPiece > m_Pieces;
};

} // namespace

const char* PerformerMeshName( EPerformerMesh i_Mesh )
{
  return i_Mesh == EPerformerMesh::Performer ? PerformerSkin : CharacterSkin;
}

VPerformerMesh MakePerformerMesh( EPerformerMesh i_Mesh )
{
  const VWalkerBody Body( i_Mesh == EPerformerMesh::Performer ? VBodyShape{} : CharacterShape );
  return VSculptor( Body ).Make();
}

} // namespace HostSources
