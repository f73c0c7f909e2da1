#include "SceneBuilder.h"

#include "MeshPictures.h"
#include "RestNormals.h"
#include "SurfaceBuilder.h"

#include <HarrowPluginInterface/MeshMath.h>

#include <assimp/scene.h>

#include <algorithm>
#include <cmath>

namespace HostMeshes
{
namespace
{
using namespace HarrowPluginInterface;

constexpr std::size_t MostNodes = 100'000;
constexpr std::size_t MostBones = 65'535;
constexpr std::size_t MostVertices = 20'000'000;
constexpr double DefaultTicksPerSecond = 25;

VMeshTransform ToTransform( const aiMatrix4x4& i_rM )
{
  return { i_rM.a1, i_rM.a2, i_rM.a3, i_rM.a4, i_rM.b1, i_rM.b2, i_rM.b3, i_rM.b4, i_rM.c1, i_rM.c2, i_rM.c3, i_rM.c4 };
}

template < typename TList >
bool IsFinite( const TList& i_rValues )
{
  return std::all_of( std::begin( i_rValues ), std::end( i_rValues ),
                      []( double i_Value )
                      {
                        return std::isfinite( i_Value );
                      } );
}

bool IsClose( const VMeshTransform& i_rA, const VMeshTransform& i_rB )
{
  double Size = 0, Difference = 0;
  for ( std::size_t Index = 0; Index < i_rA.size(); ++Index )
  {
    Size = std::max( Size, std::abs( i_rA[Index] ) );
    Difference = std::max( Difference, std::abs( i_rA[Index] - i_rB[Index] ) );
  }
  return Difference <= 1e-6 * Size;
}

/// Keeps the four heaviest bones of a vertex.
void AddWeight( VMeshInfluence& io_rInfluence, std::uint16_t i_Bone, float i_Weight )
{
  std::size_t Lightest = 0;
  for ( std::size_t Place = 0; Place < 4; ++Place )
  {
    if ( io_rInfluence.Weights[Place] > 0 && io_rInfluence.Bones[Place] == i_Bone )
    {
      io_rInfluence.Weights[Place] += i_Weight;
      return;
    }
    Lightest = io_rInfluence.Weights[Place] < io_rInfluence.Weights[Lightest] ? Place : Lightest;
  }
  if ( i_Weight > io_rInfluence.Weights[Lightest] )
  {
    io_rInfluence.Bones[Lightest] = i_Bone;
    io_rInfluence.Weights[Lightest] = i_Weight;
  }
}

std::array< double, 3 > ToArray( const aiVector3D& i_rValue )
{
  return { i_rValue.x, i_rValue.y, i_rValue.z };
}
std::array< double, 4 > ToArray( const aiQuaternion& i_rValue )
{
  const double Length = std::sqrt( double{ i_rValue.x } * i_rValue.x + double{ i_rValue.y } * i_rValue.y +
                                   double{ i_rValue.z } * i_rValue.z + double{ i_rValue.w } * i_rValue.w );
  if ( Length == 0 )
  {
    return { 0, 0, 0, 1 };
  }
  return { i_rValue.x / Length, i_rValue.y / Length, i_rValue.z / Length, i_rValue.w / Length };
}

/// Takes the keys that are numbers, in order of time; without any the value at rest is the one key.
template < typename TSource, typename TRest, typename TKeys >
std::size_t TakeKeys( const TSource* i_pKeys, unsigned i_Count, double i_TicksPerSecond, const TRest& i_rRest,
                      TKeys& o_rKeys )
{
  for ( unsigned Index = 0; i_pKeys && Index < i_Count; ++Index )
  {
    const double Time = i_pKeys[Index].mTime / i_TicksPerSecond;
    const auto Value = ToArray( i_pKeys[Index].mValue );
    if ( std::isfinite( Time ) && IsFinite( Value ) )
    {
      o_rKeys.push_back( { Time, Value } );
    }
  }
  std::stable_sort( o_rKeys.begin(), o_rKeys.end(),
                    []( const auto& i_rA, const auto& i_rB )
                    {
                      return i_rA.Time < i_rB.Time;
                    } );
  const std::size_t Lost = i_Count - o_rKeys.size();
  if ( o_rKeys.empty() )
  {
    o_rKeys.push_back( { 0, ToArray( i_rRest ) } );
  }
  return Lost;
}

float Part( float i_Value, float i_Default )
{
  return std::isfinite( i_Value ) ? std::clamp( i_Value, 0.0F, 1.0F ) : i_Default;
}

std::array< float, 3 > ReadColour( const aiMaterial& i_rMaterial, const char* i_pKey, unsigned i_Type, unsigned i_Index,
                                   float i_Default )
{
  aiColor3D Colour( i_Default, i_Default, i_Default );
  (void)i_rMaterial.Get( i_pKey, i_Type, i_Index, Colour );
  return { Part( Colour.r, i_Default ), Part( Colour.g, i_Default ), Part( Colour.b, i_Default ) };
}

float ReadNumber( const aiMaterial& i_rMaterial, const char* i_pKey, unsigned i_Type, unsigned i_Index,
                  float i_Default )
{
  float Value = i_Default;
  (void)i_rMaterial.Get( i_pKey, i_Type, i_Index, Value );
  return std::isfinite( Value ) && Value >= 0 ? Value : i_Default;
}
} // namespace

VSceneBuilder::VSceneBuilder( const aiScene& i_rScene, std::filesystem::path i_Folder )
  : m_rScene( i_rScene )
  , m_Folder( std::move( i_Folder ) )
{
}

bool VSceneBuilder::Build( double i_MillimetresPerUnit, VMeshScene& o_rMesh, std::string& o_rReason )
{
  m_Mesh.MillimetresPerUnit = i_MillimetresPerUnit;
  AddNodes();
  if ( !AddSurfaces( o_rReason ) )
  {
    return false;
  }
  AddMaterials();
  AddAnimations();
  o_rMesh = std::move( m_Mesh );
  return true;
}

std::string VSceneBuilder::Repairs() const
{
  std::string Text;
  for ( const auto& [Count, pWhat] : { std::pair{ m_Faults.Surfaces, "surfaces without triangles" },
                                       { m_Faults.Vertices, "vertices" },
                                       { m_Faults.Triangles, "triangles" },
                                       { m_Faults.Weights, "weights" },
                                       { m_Faults.Keys, "keys" } } )
  {
    if ( Count > 0 )
    {
      Text.append( Text.empty() ? "" : ", " ).append( std::to_string( Count ) ).append( " " ).append( pWhat );
    }
  }
  return Text;
}

void VSceneBuilder::AddNodes()
{
  struct VEntry
  {
    const aiNode* pNode;
    std::int32_t Parent;
  };
  std::vector< VEntry > Waiting{ { m_rScene.mRootNode, -1 } };
  while ( !Waiting.empty() && m_Mesh.Nodes.size() < MostNodes )
  {
    const auto [pNode, Parent] = Waiting.back();
    Waiting.pop_back();
    const auto Index = static_cast< std::uint32_t >( m_Mesh.Nodes.size() );
    VMeshNode Node{ pNode->mName.C_Str(), Parent, ToTransform( pNode->mTransformation ) };
    if ( !IsFinite( Node.Local ) )
    {
      Node.Local = MeshIdentity;
    }
    m_RestWorlds.push_back( Parent < 0 ? Node.Local : m_RestWorlds[static_cast< std::size_t >( Parent )] * Node.Local );
    m_NodesByName.try_emplace( Node.Name, Index );
    m_Mesh.Nodes.push_back( std::move( Node ) );
    m_Sources.push_back( pNode );
    for ( unsigned Child = pNode->mNumChildren; Child-- > 0; )
    {
      Waiting.push_back( { pNode->mChildren[Child], static_cast< std::int32_t >( Index ) } );
    }
  }
}

bool VSceneBuilder::AddSurfaces( std::string& o_rReason )
{
  std::size_t Vertices = 0;
  for ( std::uint32_t Node = 0; Node < m_Sources.size(); ++Node )
  {
    const aiNode& rNode = *m_Sources[Node];
    for ( unsigned Mesh = 0; Mesh < rNode.mNumMeshes; ++Mesh )
    {
      if ( rNode.mMeshes[Mesh] >= m_rScene.mNumMeshes || !m_rScene.mMeshes[rNode.mMeshes[Mesh]] )
      {
        ++m_Faults.Surfaces;
        continue;
      }
      const aiMesh& rMesh = *m_rScene.mMeshes[rNode.mMeshes[Mesh]];
      Vertices += rMesh.mNumVertices;
      if ( Vertices > MostVertices )
      {
        o_rReason = "it has too many vertices";
        return false;
      }
      AddSurface( rMesh, Node );
      if ( m_Mesh.Bones.size() > MostBones )
      {
        o_rReason = "it has too many bones";
        return false;
      }
    }
  }
  o_rReason = "it holds no triangle that can be drawn";
  return !m_Mesh.Surfaces.empty();
}

void VSceneBuilder::AddSurface( const aiMesh& i_rMesh, std::uint32_t i_Node )
{
  const VMeshTransform& rWorld = m_RestWorlds[i_Node];
  VMeshTransform Up;
  VMeshSurface Surface;
  VSurfaceFaults Faults;
  // A surface that its nodes flatten is not seen.
  bool bSeen = InvertMesh( rWorld, Up );
  if ( bSeen )
  {
    Surface.Influences = Influences( i_rMesh, i_Node, Up );
    bSeen = FillSurface( i_rMesh, rWorld, Surface, Faults );
  }
  m_Faults.Vertices += Faults.Vertices;
  m_Faults.Triangles += Faults.Triangles;
  if ( !bSeen )
  {
    ++m_Faults.Surfaces;
    return;
  }
  Surface.Bone = Surface.Influences.empty() ? BoneOf( i_Node, Up ) : 0;
  Surface.Material = i_rMesh.mMaterialIndex;
  BindRestNormals( m_Mesh, m_RestWorlds, Surface );
  m_Mesh.Surfaces.push_back( std::move( Surface ) );
}

std::vector< VMeshInfluence > VSceneBuilder::Influences( const aiMesh& i_rMesh, std::uint32_t i_Node,
                                                         const VMeshTransform& i_rUp )
{
  std::vector< VMeshInfluence > Found( i_rMesh.mNumVertices );
  bool bAny = false;
  for ( unsigned Bone = 0; i_rMesh.mBones && Bone < i_rMesh.mNumBones; ++Bone )
  {
    const aiBone& rBone = *i_rMesh.mBones[Bone];
    const VMeshTransform Offset = ToTransform( rBone.mOffsetMatrix );
    const auto ItNode = m_NodesByName.find( rBone.mName.C_Str() );
    const bool bGood = ItNode != m_NodesByName.end() && IsFinite( Offset );
    std::uint32_t Index = 0;
    bool bMade = false;
    for ( unsigned Weight = 0; rBone.mWeights && Weight < rBone.mNumWeights; ++Weight )
    {
      const auto& [Vertex, Value] = rBone.mWeights[Weight];
      if ( !bGood || Vertex >= Found.size() || !std::isfinite( Value ) || Value < 0 || Value > 1e6F )
      {
        ++m_Faults.Weights;
        continue;
      }
      if ( Value > 0 )
      {
        Index = std::exchange( bMade, true ) ? Index : BoneOf( ItNode->second, Offset * i_rUp );
        AddWeight( Found[Vertex], static_cast< std::uint16_t >( Index ), Value );
        bAny = true;
      }
    }
  }
  if ( !bAny )
  {
    return {};
  }
  for ( VMeshInfluence& rInfluence : Found )
  {
    const float Sum = rInfluence.Weights[0] + rInfluence.Weights[1] + rInfluence.Weights[2] + rInfluence.Weights[3];
    if ( !( Sum > 1e-6F ) )
    {
      // What no bone holds moves with the surface's own node.
      rInfluence = { { static_cast< std::uint16_t >( BoneOf( i_Node, i_rUp ) ), 0, 0, 0 }, { 1, 0, 0, 0 } };
      continue;
    }
    for ( float& rWeight : rInfluence.Weights )
    {
      rWeight /= Sum;
    }
  }
  return Found;
}

std::uint32_t VSceneBuilder::BoneOf( std::uint32_t i_Node, const VMeshTransform& i_rInverseBind )
{
  const auto [Begin, End] = m_BonesByNode.equal_range( i_Node );
  for ( auto It = Begin; It != End; ++It )
  {
    if ( IsClose( m_Mesh.Bones[It->second].InverseBind, i_rInverseBind ) )
    {
      return It->second;
    }
  }
  const auto Bone = static_cast< std::uint32_t >( m_Mesh.Bones.size() );
  m_Mesh.Bones.push_back( { m_Mesh.Nodes[i_Node].Name, i_Node, i_rInverseBind } );
  m_BonesByNode.emplace( i_Node, Bone );
  return Bone;
}

void VSceneBuilder::AddMaterials()
{
  for ( unsigned Index = 0; Index < m_rScene.mNumMaterials; ++Index )
  {
    const aiMaterial& rSource = *m_rScene.mMaterials[Index];
    VMeshMaterial Material;
    Material.Name = rSource.GetName().C_Str();
    Material.Colour = ReadColour( rSource, AI_MATKEY_COLOR_DIFFUSE, 1 );
    Material.Specular = ReadColour( rSource, AI_MATKEY_COLOR_SPECULAR, 0 );
    Material.Emissive = ReadColour( rSource, AI_MATKEY_COLOR_EMISSIVE, 0 );
    Material.Alpha = Part( ReadNumber( rSource, AI_MATKEY_OPACITY, 1 ), 1 );
    // Some writers say "not at all" where they mean nothing by it.
    Material.Alpha = Material.Alpha < 0.01F ? 1.0F : Material.Alpha;
    Material.Shininess = std::min( ReadNumber( rSource, AI_MATKEY_SHININESS, 0 ), 1000.0F );
    const float Strength = Part( ReadNumber( rSource, AI_MATKEY_SHININESS_STRENGTH, 1 ), 1 );
    for ( float& rPart : Material.Specular )
    {
      rPart *= Strength;
    }
    Material.pPicture = ReadPicture( m_rScene, rSource, m_Folder );
    m_Mesh.Materials.push_back( std::move( Material ) );
  }
  for ( VMeshSurface& rSurface : m_Mesh.Surfaces )
  {
    if ( rSurface.Material >= m_Mesh.Materials.size() )
    {
      rSurface.Material = static_cast< std::uint32_t >( m_Mesh.Materials.size() );
      m_Mesh.Materials.push_back( {} );
    }
  }
}

void VSceneBuilder::AddAnimations()
{
  for ( unsigned Index = 0; Index < m_rScene.mNumAnimations; ++Index )
  {
    const aiAnimation& rSource = *m_rScene.mAnimations[Index];
    const double Rate =
        rSource.mTicksPerSecond > 0 && rSource.mTicksPerSecond < 1e12 ? rSource.mTicksPerSecond : DefaultTicksPerSecond;
    VMeshAnimation Animation;
    Animation.Name = rSource.mName.C_Str();
    for ( unsigned Channel = 0; Channel < rSource.mNumChannels; ++Channel )
    {
      const aiNodeAnim& rKeys = *rSource.mChannels[Channel];
      const auto ItNode = m_NodesByName.find( rKeys.mNodeName.C_Str() );
      if ( ItNode == m_NodesByName.end() )
      {
        ++m_Faults.Keys;
        continue;
      }
      aiVector3D Scale, Place;
      aiQuaternion Turn;
      m_Sources[ItNode->second]->mTransformation.Decompose( Scale, Turn, Place );
      VMeshChannel Taken;
      Taken.Node = ItNode->second;
      m_Faults.Keys += TakeKeys( rKeys.mPositionKeys, rKeys.mNumPositionKeys, Rate, Place, Taken.Positions );
      m_Faults.Keys += TakeKeys( rKeys.mRotationKeys, rKeys.mNumRotationKeys, Rate, Turn, Taken.Rotations );
      m_Faults.Keys += TakeKeys( rKeys.mScalingKeys, rKeys.mNumScalingKeys, Rate, Scale, Taken.Scales );
      Animation.Duration = std::max(
          { Animation.Duration, Taken.Positions.back().Time, Taken.Rotations.back().Time, Taken.Scales.back().Time } );
      Animation.Channels.push_back( std::move( Taken ) );
    }
    if ( !Animation.Channels.empty() )
    {
      m_Mesh.Animations.push_back( std::move( Animation ) );
    }
  }
}

} // namespace HostMeshes
