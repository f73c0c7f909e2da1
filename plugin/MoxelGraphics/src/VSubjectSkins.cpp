#include <MoxelGraphics/VSubjectSkins.h>

#include "Log.h"
#include "VWornMesh.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VResources.h>

#include <algorithm>
#include <array>
#include <set>

namespace MoxelGraphics
{
namespace
{
using namespace CoreGraphics;
using namespace HarrowPluginInterface;

/// The uniforms of one program.
struct VSkinUniforms
{
  VUniform Bones{ "u_BoneTransforms" };
  VUniform HighlightMissing{ "u_HighlightMissing" };
  VUniform Transform{ "u_ModelTransform" };
  VUniform Colour{ "u_ModelColour" };
  VUniform Texture{ "t_DiffuseTexture" };
  VUniform UserColourA{ "u_UserColourA" };
  VUniform UserColourB{ "u_UserColourB" };
  VUniform Specular{ "u_SpecularColour" };
  VUniform Emissive{ "u_EmissiveColour" };
  VUniform Shininess{ "u_Shininess" };
  VUniform Alpha{ "u_Alpha" };
  std::uint64_t Link = 0, Matrices = 0; ///< the serials of the link and of the matrices that it holds
};

/// A look, in the visible modes and in those of picking.
struct VSkinLook
{
  VProgramPair Pair;
  VSkinUniforms Visible, Picked;

  VSkinUniforms* Use( VRenderContext& io_rContext )
  {
    if ( !Pair.Use( io_rContext ) )
    {
      return nullptr;
    }
    return io_rContext.RenderMode() == ERenderModeNormal ? &Visible : &Picked;
  }
};

QVector3D ToVector( const std::array< float, 3 >& i_rValue )
{
  return { i_rValue[0], i_rValue[1], i_rValue[2] };
}

QVector4D ToColour( std::uint32_t i_Colour )
{
  const auto Part = [&]( int i_Shift )
  {
    return static_cast< float >( i_Colour >> i_Shift & 0xFF ) / 255.0F;
  };
  return { Part( 0 ), Part( 8 ), Part( 16 ), 1 };
}

VRenderState SkinState( bool i_bBlended, bool i_bXRay )
{
  VRenderState State;
  State.depthFunction = EDepthLessOrEqual;
  State.colourBlend = i_bBlended ? EColourBlendAlpha : EColourBlendNone;
  State.depthWrite = !i_bXRay;
  // A skin with an open rim is seen from inside; one that is looked through is not.
  State.cullMode = i_bXRay ? ECullBack : ECullNone;
  return State;
}
} // namespace

struct VSubjectSkins::VState
{
  struct VHeld
  {
    const VSubjectGroup* pGroup = nullptr;
    std::uint64_t Structure = 0, Cache = 0;
    std::vector< std::unique_ptr< VWornMesh > > Worn; ///< of the records that wear something
    VCounts Counts;
  };
  /// What a `Draw` is about.
  struct VDraw
  {
    VRenderContext& rContext;
    bool bXRay;
    std::uint32_t Word = 0; ///< of the record at hand
    QVector4D Colour{ 1, 1, 1, 1 };
  };

  explicit VState( VMoxelScene& i_rScene )
    : rScene( i_rScene )
  {
    if ( rScene.MeshCache() )
    {
      Connection = rScene.MeshCache()->Changed().Connect(
          [pGeneration = pCacheGeneration]
          {
            ++*pGeneration;
          },
          nullptr );
    }
  }

  void LoadPrograms();
  void Update( VHeld& io_rHeld, const VSubjectGroup& i_rGroup );
  void TakeMesh( VWornMesh& io_rWorn, const VSubjectGroup& i_rGroup, bool i_bAnew );
  std::shared_ptr< VSkinMesh > FindMesh( const VSubjectRecord& i_rRecord );
  void TellUnmatched( const VSubjectRecord& i_rRecord );
  bool DrawWorn( VDraw& io_rDraw, VWornMesh& io_rWorn, bool& o_rbOnCpu );
  bool DrawSkin( VDraw& io_rDraw, VWornMesh& io_rWorn );
  bool DrawMoved( VDraw& io_rDraw, VWornMesh& io_rWorn );
  bool DrawRigid( VDraw& io_rDraw, VWornMesh& io_rWorn );
  void SetMaterial( VDraw& io_rDraw, VSkinLook& io_rLook, VSkinUniforms& io_rUniforms, VSkinMesh& io_rMesh,
                    VSkinMesh::VPart& io_rPart ) const;

  VMoxelScene& rScene;
  const std::shared_ptr< std::atomic< std::uint64_t > > pCacheGeneration =
      std::make_shared< std::atomic< std::uint64_t > >( 1 );
  ZEK::VConnection Connection;
  std::array< VHeld, GroupCount > Groups;
  std::map< const VMeshScene*, std::shared_ptr< VSkinMesh > > Meshes;
  std::set< std::string > Told;
  bool bLoaded = false, bHighlightMissing = false;
  VSkinLook Skin, SkinXRay, Still, StillXRay;
  const VRenderState Solid = SkinState( false, false ), Blended = SkinState( true, false ),
                     XRay = SkinState( true, true );
};

VSubjectSkins::VSubjectSkins( VMoxelScene& i_rScene )
  : m_pState( std::make_unique< VState >( i_rScene ) )
{
}

VSubjectSkins::~VSubjectSkins() = default;

void VSubjectSkins::SetHighlightMissing( bool i_bOn )
{
  m_pState->bHighlightMissing = i_bOn;
}

const VSubjectSkins::VCounts& VSubjectSkins::Counts( std::size_t i_Index ) const
{
  return m_pState->Groups.at( i_Index ).Counts;
}

void VSubjectSkins::VState::LoadPrograms()
{
  if ( std::exchange( bLoaded, true ) )
  {
    return;
  }
  VResources& rResources = *rScene.Resources();
  if ( rResources.HasSkinning() )
  {
    Skin.Pair.Load( rResources, "FBXSkin", "FBXMaterial" );
    SkinXRay.Pair.Load( rResources, "FBXSkin", "XRay" );
  }
  Still.Pair.Load( rResources, "FBXColoredMesh", "FBXMaterial" );
  StillXRay.Pair.Load( rResources, "FBXColoredMesh", "XRay" );
}

void VSubjectSkins::VState::Update( VHeld& io_rHeld, const VSubjectGroup& i_rGroup )
{
  const std::uint64_t Cache = pCacheGeneration->load();
  const bool bAnew = io_rHeld.pGroup != &i_rGroup || io_rHeld.Structure != i_rGroup.StructureGeneration;
  if ( !bAnew && io_rHeld.Cache == Cache )
  {
    return;
  }
  io_rHeld.pGroup = &i_rGroup;
  io_rHeld.Structure = i_rGroup.StructureGeneration;
  io_rHeld.Cache = Cache;
  if ( bAnew )
  {
    io_rHeld.Worn.clear();
    for ( std::size_t Record = 0; Record < i_rGroup.Records.size(); ++Record )
    {
      if ( !i_rGroup.Records[Record].Mesh.Name.empty() )
      {
        io_rHeld.Worn.push_back( std::make_unique< VWornMesh >( Record ) );
      }
    }
  }
  for ( const auto& rpWorn : io_rHeld.Worn )
  {
    TakeMesh( *rpWorn, i_rGroup, bAnew );
  }
  std::erase_if( Meshes,
                 []( const auto& i_rMesh )
                 {
                   return i_rMesh.second.use_count() == 1;
                 } );
}

void VSubjectSkins::VState::TakeMesh( VWornMesh& io_rWorn, const VSubjectGroup& i_rGroup, bool i_bAnew )
{
  const VSubjectRecord& rRecord = i_rGroup.Records[io_rWorn.Record()];
  std::shared_ptr< VSkinMesh > pMesh = FindMesh( rRecord );
  if ( i_bAnew || pMesh.get() != io_rWorn.Mesh() )
  {
    io_rWorn.SetMesh( std::move( pMesh ), i_rGroup );
    if ( io_rWorn.Pose( i_rGroup ) == VWornMesh::EState::Unmatched )
    {
      TellUnmatched( rRecord );
    }
  }
}

std::shared_ptr< VSkinMesh > VSubjectSkins::VState::FindMesh( const VSubjectRecord& i_rRecord )
{
  auto pMesh = rScene.MeshCache() ? rScene.MeshCache()->Request( i_rRecord.Mesh.Category, i_rRecord.Mesh.Name )
                                  : std::shared_ptr< const VMeshScene >();
  if ( !pMesh )
  {
    return nullptr;
  }
  const auto It = Meshes.find( pMesh.get() );
  if ( It != Meshes.end() )
  {
    return It->second;
  }
  if ( !VSkinMesh::IsSound( *pMesh ) )
  {
    if ( Told.insert( i_rRecord.Mesh.Name ).second )
    {
      ZEK::Log( LogCategory(), ZEK::ELogWarning, "Mesh \"%1%\" is broken and not drawn", i_rRecord.Mesh.Name );
    }
    return nullptr;
  }
  const VMeshScene* const pKey = pMesh.get();
  return Meshes.emplace( pKey, std::make_shared< VSkinMesh >( std::move( pMesh ) ) ).first->second;
}

void VSubjectSkins::VState::TellUnmatched( const VSubjectRecord& i_rRecord )
{
  if ( Told.insert( i_rRecord.Mesh.Name + '\n' + i_rRecord.Name ).second )
  {
    ZEK::Log( LogCategory(), ZEK::ELogWarning,
              "Mesh \"%1%\" has no bone of the name of one of subject \"%2%\" and is not drawn", i_rRecord.Mesh.Name,
              i_rRecord.Name );
  }
}

void VSubjectSkins::Draw( VRenderContext& io_rContext, const VSubjectGroup& i_rGroup, std::size_t i_Index, bool i_bXRay,
                          bool i_bHighlightCurrent )
{
  VState& rState = *m_pState;
  VState::VHeld& rHeld = rState.Groups.at( i_Index );
  rState.LoadPrograms();
  rState.Update( rHeld, i_rGroup );
  rHeld.Counts = {};
  VState::VDraw Draw{ io_rContext, i_bXRay };
  const int Mode = io_rContext.RenderMode();
  for ( const auto& rpWorn : rHeld.Worn )
  {
    const VSubjectRecord& rRecord = i_rGroup.Records[rpWorn->Record()];
    const VWornMesh::EState State = rpWorn->Pose( i_rGroup );
    rHeld.Counts.Waiting += State == VWornMesh::EState::Waiting ? 1 : 0;
    rHeld.Counts.Unmatched += State == VWornMesh::EState::Unmatched ? 1 : 0;
    const auto Shown = static_cast< std::uint8_t >( i_bHighlightCurrent ? 0xFF : ~EInstancePrimary );
    Draw.Word = ( rRecord.Id & EIdMask ) | ( std::uint32_t{ rRecord.Flags } & Shown ) << 21U;
    const bool bPicked = Mode != ERenderModeNormal;
    if ( State != VWornMesh::EState::Posed ||
         ( bPicked && ( ( rRecord.Id & EIdMask ) == 0 || rState.rScene.IgnoreId( Draw.Word, Mode ) ) ) )
    {
      continue;
    }
    bool bOnCpu = false;
    Draw.Colour = rRecord.Mesh.bByRoot ? ToColour( rRecord.Colour ) : QVector4D( 1, 1, 1, 1 );
    if ( rState.DrawWorn( Draw, *rpWorn, bOnCpu ) )
    {
      ++rHeld.Counts.Drawn;
      rHeld.Counts.OnCpu += bOnCpu ? 1 : 0;
    }
  }
}

bool VSubjectSkins::VState::DrawWorn( VDraw& io_rDraw, VWornMesh& io_rWorn, bool& o_rbOnCpu )
{
  if ( io_rWorn.IsRigid() )
  {
    return DrawRigid( io_rDraw, io_rWorn );
  }
  o_rbOnCpu = io_rWorn.Matrices().size() > VSkinMesh::MostBones || !rScene.Resources()->HasSkinning();
  return o_rbOnCpu ? DrawMoved( io_rDraw, io_rWorn ) : DrawSkin( io_rDraw, io_rWorn );
}

bool VSubjectSkins::VState::DrawSkin( VDraw& io_rDraw, VWornMesh& io_rWorn )
{
  // Both looks have one program in the modes of picking, and so one memory of what it holds.
  VSkinLook& rLook = io_rDraw.bXRay && io_rDraw.rContext.RenderMode() == ERenderModeNormal ? SkinXRay : Skin;
  VSkinUniforms* const pUniforms = rLook.Use( io_rDraw.rContext );
  if ( !pUniforms )
  {
    return false;
  }
  VShaderProgram& rProgram = *rLook.Pair.Current();
  // The program keeps its matrices: a subject that is drawn twice gives them once.
  if ( pUniforms->Link != rProgram.LinkSerial() || pUniforms->Matrices != io_rWorn.Serial() )
  {
    const std::span< const VSkinMatrix > Matrices = io_rWorn.Matrices();
    rProgram.SetUniformMatrices( pUniforms->Bones.Location( rProgram ),
                                 std::span( Matrices.data()->data(), 16 * Matrices.size() ) );
    pUniforms->Link = rProgram.LinkSerial();
    pUniforms->Matrices = io_rWorn.Serial();
  }
  pUniforms->HighlightMissing.Set( rProgram, bHighlightMissing ? 1 : 0 );
  for ( VSkinMesh::VPart& rPart : io_rWorn.Mesh()->Parts() )
  {
    if ( io_rDraw.rContext.SetVertexBuffer( rPart.Mesh.Stream() ) )
    {
      SetMaterial( io_rDraw, rLook, *pUniforms, *io_rWorn.Mesh(), rPart );
      io_rDraw.rContext.DrawElements( GL_TRIANGLES, rPart.Mesh );
    }
  }
  return true;
}

bool VSubjectSkins::VState::DrawMoved( VDraw& io_rDraw, VWornMesh& io_rWorn )
{
  VSkinLook& rLook = io_rDraw.bXRay ? StillXRay : Still;
  VSkinUniforms* const pUniforms = rLook.Use( io_rDraw.rContext );
  VDynamicBuffer* const pMoved = pUniforms ? io_rWorn.MovedVertices() : nullptr;
  if ( !pMoved )
  {
    return false;
  }
  VShaderProgram& rProgram = *rLook.Pair.Current();
  pUniforms->Transform.Set( rProgram, QMatrix4x4() );
  pUniforms->Colour.Set( rProgram, QVector4D( 1, 1, 1, 1 ) );
  for ( VSkinMesh::VPart& rPart : io_rWorn.Mesh()->Parts() )
  {
    const VVertexStream Streams[] = { { pMoved, &VSkinMesh::MovedLayout(), rPart.FirstVertex * sizeof( VSkinVertex ) },
                                      { rPart.Mesh.Stream().pBuffer, &VSkinMesh::UVLayout(), 0 } };
    if ( io_rDraw.rContext.SetVertexStreams( Streams ) )
    {
      SetMaterial( io_rDraw, rLook, *pUniforms, *io_rWorn.Mesh(), rPart );
      io_rDraw.rContext.DrawElements( GL_TRIANGLES, rPart.Mesh );
    }
  }
  return true;
}

bool VSubjectSkins::VState::DrawRigid( VDraw& io_rDraw, VWornMesh& io_rWorn )
{
  VSkinLook& rLook = io_rDraw.bXRay ? StillXRay : Still;
  VSkinUniforms* const pUniforms = rLook.Use( io_rDraw.rContext );
  if ( !pUniforms )
  {
    return false;
  }
  VShaderProgram& rProgram = *rLook.Pair.Current();
  pUniforms->Transform.Set( rProgram, io_rWorn.Model() );
  pUniforms->Colour.Set( rProgram, io_rDraw.Colour );
  for ( VSkinMesh::VPart& rPart : io_rWorn.Mesh()->Parts() )
  {
    if ( io_rDraw.rContext.SetVertexBuffer( rPart.Mesh.Stream() ) )
    {
      SetMaterial( io_rDraw, rLook, *pUniforms, *io_rWorn.Mesh(), rPart );
      io_rDraw.rContext.DrawElements( GL_TRIANGLES, rPart.Mesh );
    }
  }
  return true;
}

void VSubjectSkins::VState::SetMaterial( VDraw& io_rDraw, VSkinLook& io_rLook, VSkinUniforms& io_rUniforms,
                                         VSkinMesh& io_rMesh, VSkinMesh::VPart& io_rPart ) const
{
  VRenderContext& rContext = io_rDraw.rContext;
  if ( rContext.RenderMode() != ERenderModeNormal )
  {
    rContext.SetRenderState( Solid );
    io_rLook.Pair.SetSelectionColour( io_rDraw.Word );
    return;
  }
  const VMeshMaterial& rMaterial = io_rPart.rMaterial;
  VShaderProgram& rProgram = *io_rLook.Pair.Current();
  rContext.SetRenderState( io_rDraw.bXRay ? XRay : rMaterial.Alpha < 1 ? Blended : Solid );
  io_rMesh.BindTexture( rContext, io_rPart );
  io_rUniforms.Texture.Set( rProgram, 0 );
  if ( io_rDraw.bXRay )
  {
    return;
  }
  // The colour of the material stands in for a picture.
  const QVector4D User = io_rPart.pTexture ? QVector4D() : QVector4D( ToVector( rMaterial.Colour ), 1 );
  io_rUniforms.UserColourA.Set( rProgram, User );
  io_rUniforms.UserColourB.Set( rProgram, User );
  io_rUniforms.Specular.Set( rProgram, ToVector( rMaterial.Specular ) );
  io_rUniforms.Emissive.Set( rProgram, ToVector( rMaterial.Emissive ) );
  io_rUniforms.Shininess.Set( rProgram, rMaterial.Shininess );
  io_rUniforms.Alpha.Set( rProgram, rMaterial.Alpha );
}

} // namespace MoxelGraphics
