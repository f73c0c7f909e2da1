#include "SkinMapping.h"

#include <HarrowPluginInterface/MeshMath.h>

#include <algorithm>
#include <cmath>
#include <limits>
#include <unordered_map>

namespace MoxelGraphics
{
namespace
{
using namespace HarrowPluginInterface;

/// What takes the mesh, in its units, into a bone that stands at its bind pose without a size of its own, in mm.
bool MakeBind( const VMeshTransform& i_rInverseBind, double i_Scale, VBonePose& o_rBind )
{
  VMeshTransform Stand;
  if ( !InvertMesh( i_rInverseBind, Stand ) )
  {
    return false;
  }
  for ( std::size_t Column = 0; Column < 3; ++Column )
  {
    const double Length = std::hypot( Stand[Column], Stand[4 + Column], Stand[8 + Column] );
    for ( std::size_t Row = 0; Row < 12; Row += 4 )
    {
      Stand[Row + Column] /= Length;
    }
  }
  VMeshTransform Inverse;
  if ( !InvertMesh( Stand, Inverse ) )
  {
    return false;
  }
  // Turn the mesh at its own size, shift it by millimetres.
  for ( std::size_t Index = 0; Index < 12; ++Index )
  {
    o_rBind[Index] = static_cast< float >( Inverse[Index] * i_Scale );
  }
  return true;
}

/// The bones that stand for nodes, and the nodes' places.
class VNodes
{
public:
  explicit VNodes( const VMeshScene& i_rMesh )
    : m_rMesh( i_rMesh )
    , m_Bones( i_rMesh.Nodes.size(), VSkinBone::None )
  {
    for ( std::size_t Bone = i_rMesh.Bones.size(); Bone-- > 0; )
    {
      m_Bones[i_rMesh.Bones[Bone].Node] = static_cast< std::int32_t >( Bone );
    }
    PoseNodes( i_rMesh, std::numeric_limits< std::size_t >::max(), 0, m_Worlds );
  }

  std::int32_t ParentOf( std::int32_t i_Node ) const
  {
    return m_rMesh.Nodes[static_cast< std::size_t >( i_Node )].Parent;
  }
  std::int32_t BoneOf( std::int32_t i_Node ) const { return m_Bones[static_cast< std::size_t >( i_Node )]; }
  /// The nearest bone above a node.
  std::int32_t BoneAbove( std::int32_t i_Node ) const
  {
    std::int32_t Node = ParentOf( i_Node );
    while ( Node >= 0 && BoneOf( Node ) < 0 )
    {
      Node = ParentOf( Node );
    }
    return Node < 0 ? VSkinBone::None : BoneOf( Node );
  }
  bool InverseBindOf( std::int32_t i_Node, VMeshTransform& o_rInverse ) const
  {
    if ( const std::int32_t Bone = BoneOf( i_Node ); Bone >= 0 )
    {
      o_rInverse = m_rMesh.Bones[static_cast< std::size_t >( Bone )].InverseBind;
      return true;
    }
    return InvertMesh( m_Worlds[static_cast< std::size_t >( i_Node )], o_rInverse );
  }

private:
  const VMeshScene& m_rMesh;
  std::vector< std::int32_t > m_Bones;
  std::vector< VMeshTransform > m_Worlds;
};

bool IsFinite( const VBonePose& i_rPose )
{
  float Sum = 0;
  for ( const float Value : i_rPose )
  {
    Sum += Value - Value;
  }
  return Sum == 0;
}

void Multiply( const VBonePose& i_rPose, const VBonePose& i_rBind, VSkinMatrix& o_rMatrix )
{
  for ( std::size_t Row = 0; Row < 3; ++Row )
  {
    const float* const pRow = i_rPose.data() + 4 * Row;
    for ( std::size_t Column = 0; Column < 4; ++Column )
    {
      o_rMatrix[4 * Column + Row] = pRow[0] * i_rBind[Column] + pRow[1] * i_rBind[4 + Column] +
                                    pRow[2] * i_rBind[8 + Column] + ( Column == 3 ? pRow[3] : 0.0F );
    }
    o_rMatrix[4 * Row + 3] = 0;
  }
}

/// Bones without a matrix, which say so by their last element, take that of the nearest parent that has one.
void FillGaps( std::span< const VSkinBone > i_Bones, std::vector< VSkinMatrix >& io_rMatrices )
{
  const auto HasMatrix = []( const VSkinMatrix& i_rMatrix )
  {
    return i_rMatrix[15] >= 0;
  };
  const auto First = static_cast< std::size_t >( std::find_if( io_rMatrices.begin(), io_rMatrices.end(), HasMatrix ) -
                                                 io_rMatrices.begin() );
  for ( std::size_t Bone = 0; Bone < i_Bones.size(); ++Bone )
  {
    if ( HasMatrix( io_rMatrices[Bone] ) )
    {
      continue;
    }
    std::int32_t From = i_Bones[Bone].Parent;
    while ( From >= 0 && !HasMatrix( io_rMatrices[static_cast< std::size_t >( From )] ) )
    {
      From = i_Bones[static_cast< std::size_t >( From )].Parent;
    }
    io_rMatrices[Bone] = io_rMatrices[From < 0 ? First : static_cast< std::size_t >( From )];
  }
}
} // namespace

std::string PlainBoneName( std::string_view i_Name )
{
  const std::size_t Colon = i_Name.rfind( ':' );
  std::string Plain( Colon == std::string_view::npos ? i_Name : i_Name.substr( Colon + 1 ) );
  for ( char& rSign : Plain )
  {
    rSign = rSign >= 'A' && rSign <= 'Z' ? static_cast< char >( rSign - 'A' + 'a' ) : rSign;
  }
  return Plain;
}

std::vector< VSkinBone > MapBonesByName( const VMeshScene& i_rMesh, std::span< const std::string > i_PoseNames,
                                         double i_Scale )
{
  std::unordered_map< std::string, std::int32_t > Poses;
  for ( std::size_t Pose = 0; Pose < i_PoseNames.size(); ++Pose )
  {
    Poses.try_emplace( PlainBoneName( i_PoseNames[Pose] ), static_cast< std::int32_t >( Pose ) );
  }
  const VNodes Nodes( i_rMesh );
  std::vector< VSkinBone > Bones( i_rMesh.Bones.size() );
  bool bAny = false;
  for ( std::size_t Bone = 0; Bone < Bones.size(); ++Bone )
  {
    VSkinBone& rBone = Bones[Bone];
    const auto Own = static_cast< std::int32_t >( i_rMesh.Bones[Bone].Node );
    rBone.Parent = Nodes.BoneAbove( Own );
    for ( std::int32_t Node = Own; Node >= 0 && rBone.Pose < 0; Node = Nodes.ParentOf( Node ) )
    {
      const auto It = Poses.find( PlainBoneName( i_rMesh.Nodes[static_cast< std::size_t >( Node )].Name ) );
      VMeshTransform InverseBind = i_rMesh.Bones[Bone].InverseBind;
      if ( It != Poses.end() && ( Node == Own || Nodes.InverseBindOf( Node, InverseBind ) ) &&
           MakeBind( InverseBind, i_Scale, rBone.Bind ) )
      {
        rBone.Pose = It->second;
        bAny = true;
      }
    }
  }
  return bAny ? Bones : std::vector< VSkinBone >();
}

std::vector< VSkinBone > MapBonesByIndex( const VMeshScene& i_rMesh, double i_Scale )
{
  const VNodes Nodes( i_rMesh );
  std::vector< VSkinBone > Bones( i_rMesh.Bones.size() );
  for ( std::size_t Bone = 0; Bone < Bones.size(); ++Bone )
  {
    const VMeshBone& rSource = i_rMesh.Bones[Bone];
    Bones[Bone].Parent = Nodes.BoneAbove( static_cast< std::int32_t >( rSource.Node ) );
    Bones[Bone].Pose = MakeBind( rSource.InverseBind, i_Scale, Bones[Bone].Bind ) ? static_cast< std::int32_t >( Bone )
                                                                                  : VSkinBone::None;
  }
  return Bones;
}

bool PoseSkin( std::span< const VSkinBone > i_Bones, std::span< const VBonePose > i_Poses,
               std::span< const float > i_Health, std::vector< VSkinMatrix >& o_rMatrices )
{
  o_rMatrices.resize( i_Bones.size() );
  std::size_t Posed = 0;
  for ( std::size_t Bone = 0; Bone < i_Bones.size(); ++Bone )
  {
    VSkinMatrix& rMatrix = o_rMatrices[Bone];
    rMatrix[15] = -1;
    const auto Pose = static_cast< std::size_t >( i_Bones[Bone].Pose );
    if ( i_Bones[Bone].Pose < 0 || Pose >= i_Poses.size() || !IsFinite( i_Poses[Pose] ) )
    {
      continue;
    }
    Multiply( i_Poses[Pose], i_Bones[Bone].Bind, rMatrix );
    const float Health = Pose < i_Health.size() ? i_Health[Pose] : 1.0F;
    rMatrix[15] = Health > 0 ? std::min( Health, 1.0F ) : 0.0F;
    ++Posed;
  }
  if ( Posed > 0 && Posed < i_Bones.size() )
  {
    FillGaps( i_Bones, o_rMatrices );
  }
  return Posed > 0;
}

} // namespace MoxelGraphics
