#pragma once

// Many objects of one kind as the instances of one draw: as they are seen, from a buffer that is written when what it
// is made from changed; in a pick, those that reach into its window; in the highlight mask, those that are marked, from
// a buffer that is kept, too.

#include "SubjectShapes.h"
#include "VPickWindow.h"

#include <MoxelGraphics/IRenderType.h>
#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VMesh.h>
#include <CoreGraphics/VProgramPair.h>
#include <CoreGraphics/VRenderContext.h>
#include <CoreGraphics/VVertexBuffer.h>

#include <array>
#include <cmath>
#include <cstdint>
#include <utility>
#include <vector>

namespace MoxelGraphics
{

/// The geometry of an object, and its colour or its flags.
template < typename TGeometry >
struct VInstance
{
  TGeometry Geometry;
  std::uint32_t Word = 0;
};

/// The generations that a buffer was made from.
using VInstanceKey = std::array< std::uint64_t, 4 >;

/// A buffer of instances, and what it was made from.
class VHeldInstances
{
public:
  /// Writes anew when the key is another, or the buffer died with its windows. `i_Fill( T* )` writes at most `i_Bound`
  /// instances and returns how many; all of them if `i_Shown` is given, which it then sets.
  template < typename T, typename TFill >
  bool Feed( const VInstanceKey& i_rKey, std::size_t i_Bound, const TFill& i_rFill )
  {
    if ( m_bHeld && m_Key == i_rKey && ( m_Count == 0 || m_Buffer.Bind() ) )
    {
      return true;
    }
    m_Key = i_rKey;
    m_Count = m_Shown = 0;
    m_bHeld = i_Bound == 0;
    if ( auto* pInstances = static_cast< T* >( m_bHeld ? nullptr : m_Buffer.Map( i_Bound * sizeof( T ) ) ) )
    {
      const auto [Count, Shown] = i_rFill( pInstances );
      m_bHeld = m_Buffer.Unmap();
      m_Count = m_bHeld ? Count : 0;
      m_Shown = m_bHeld ? Shown : 0;
    }
    return m_bHeld;
  }
  CoreGraphics::VDynamicBuffer& Buffer() { return m_Buffer; }
  /// Instances in the buffer.
  std::size_t Count() const { return m_Count; }
  /// Those of them that show.
  std::size_t Shown() const { return m_Shown; }

private:
  CoreGraphics::VDynamicBuffer m_Buffer;
  VInstanceKey m_Key{};
  std::size_t m_Count = 0, m_Shown = 0;
  bool m_bHeld = false;
};

/// Instances and how many show.
struct VFilled
{
  std::size_t Count = 0, Shown = 0;
};

/// How a kind of object looks.
struct VSubjectLook
{
  CoreGraphics::VInstancedProgramPair Programs;
  CoreGraphics::VMesh* pMesh = nullptr;
  GLenum Mode = GL_TRIANGLES;                               ///< what the mesh is made of
  const CoreGraphics::VVertexLayout* pMeshLayout = nullptr; ///< null: the mesh's own
  const CoreGraphics::VVertexLayout* pSeen = nullptr;       ///< of VInstance with colours
  const CoreGraphics::VVertexLayout* pPicked = nullptr;     ///< of VInstance with flags
  CoreGraphics::VRenderState State;

  CoreGraphics::VVertexStream MeshStream() const
  {
    CoreGraphics::VVertexStream Stream = pMesh->Stream();
    Stream.pLayout = pMeshLayout ? pMeshLayout : Stream.pLayout;
    return Stream;
  }
};

/// Instances that each have an id of their own, in as few draws as the ids allow: within one they grow.
template < typename TGeometry >
class VGatheredInstances
{
public:
  void Clear()
  {
    m_Instances.clear();
    m_Draws.clear();
    m_bWritten = false;
  }
  void Add( std::uint32_t i_Id, std::uint8_t i_Flags, const TGeometry& i_rGeometry )
  {
    const auto Place = static_cast< std::uint32_t >( m_Instances.size() );
    if ( m_Draws.empty() || i_Id - m_Draws.back().FirstId < Place - m_Draws.back().Begin ||
         i_Id - m_Draws.back().FirstId - ( Place - m_Draws.back().Begin ) >= SkipLimit )
    {
      m_Draws.push_back( { i_Id, Place } );
    }
    const VDraw& rDraw = m_Draws.back();
    m_Instances.push_back( { i_rGeometry, i_Flags | ( i_Id - rDraw.FirstId - ( Place - rDraw.Begin ) ) << SkipShift } );
  }
  bool IsEmpty() const { return m_Instances.empty(); }
  /// `i_rPrepare( program )` sets what uniforms the program has of its own.
  template < typename TPrepare >
  void Draw( CoreGraphics::VRenderContext& io_rContext, VSubjectLook& io_rLook, const TPrepare& i_rPrepare )
  {
    if ( IsEmpty() )
    {
      return;
    }
    if ( !m_bWritten || !m_Buffer.Bind() )
    {
      m_bWritten = m_Buffer.Write( std::span( m_Instances ) );
    }
    // What is to be found hides what lies behind it, however it is blended when it is seen.
    CoreGraphics::VRenderState State = io_rLook.State;
    State.depthWrite = true;
    io_rContext.SetRenderState( State );
    for ( std::size_t Index = 0; m_bWritten && Index < m_Draws.size(); ++Index )
    {
      const std::size_t Begin = m_Draws[Index].Begin;
      const std::size_t End = Index + 1 < m_Draws.size() ? m_Draws[Index + 1].Begin : m_Instances.size();
      const CoreGraphics::VVertexStream Streams[] = {
          io_rLook.MeshStream(), { &m_Buffer, io_rLook.pPicked, Begin * sizeof( VInstance< TGeometry > ) } };
      if ( !io_rLook.Programs.Use( io_rContext, m_Draws[Index].FirstId ) || !io_rContext.SetVertexStreams( Streams ) )
      {
        return;
      }
      i_rPrepare( *io_rLook.Programs.Current() );
      io_rContext.DrawElementsInstanced( io_rLook.Mode, *io_rLook.pMesh, static_cast< int >( End - Begin ) );
    }
  }

private:
  static constexpr std::uint32_t SkipShift = 8, SkipLimit = 0x4000;
  struct VDraw
  {
    std::uint32_t FirstId = 0, Begin = 0;
  };
  std::vector< VInstance< TGeometry > > m_Instances;
  std::vector< VDraw > m_Draws;
  CoreGraphics::VDynamicBuffer m_Buffer;
  bool m_bWritten = false;
};

inline bool Reaches( const VPickWindow& i_rWindow, const VScenePoint& i_rSphere )
{
  const float Depth = i_rWindow.Depth( i_rSphere.X, i_rSphere.Y, i_rSphere.Z );
  return i_rWindow.Meets( i_rSphere.X, i_rSphere.Y, i_rSphere.Z, i_rWindow.Drawn( i_rSphere.Radius, Depth ) );
}
inline bool Reaches( const VPickWindow& i_rWindow, const VColumns& i_rColumns )
{
  // No mesh reaches further from its origin than 1 along each axis.
  float Square = 0;
  for ( std::size_t Index = 0; Index < 9; ++Index )
  {
    Square += i_rColumns[Index] * i_rColumns[Index];
  }
  return i_rWindow.Meets( i_rColumns[9], i_rColumns[10], i_rColumns[11], std::sqrt( 3 * Square ) );
}
inline bool Reaches( const VPickWindow& i_rWindow, const VEnds& i_rEnds )
{
  const auto &rA = i_rEnds.A, &rB = i_rEnds.B;
  return i_rWindow.MeetsLine( { rA[0], rA[1], rA[2], StickRadius }, { rB[0], rB[1], rB[2], StickRadius } );
}

/// What a group keeps of one kind of object.
template < typename TGeometry >
struct VKindState
{
  VHeldInstances Seen;
  VGatheredInstances< TGeometry > Marked;
  VInstanceKey MarkedKey{};
};

struct VNothingToPrepare
{
  void operator()( CoreGraphics::VShaderProgram& ) const {}
};

/// What is drawn in the modes of picking: in the pick, what reaches into its window; in the highlight mask what is
/// marked, worked out when `i_rKey` moved. `io_rPicked` is scratch, `i_rPrepare( program )` sets uniforms of the kind.
template < typename TShapes, typename TPrepare = VNothingToPrepare >
void DrawMarked( CoreGraphics::VRenderContext& io_rContext, const VMoxelScene& i_rScene, VSubjectLook& io_rLook,
                 VKindState< typename TShapes::VGeometry >& io_rState,
                 VGatheredInstances< typename TShapes::VGeometry >& io_rPicked, const TShapes& i_rShapes,
                 const VInstanceKey& i_rKey, const TPrepare& i_rPrepare = {} )
{
  constexpr int Marks = CoreGraphics::EInstanceSelected | CoreGraphics::EInstancePreselected;
  const std::size_t Count = i_rShapes.Count();
  typename TShapes::VGeometry Geometry;
  if ( io_rContext.RenderMode() == ERenderModeSelection )
  {
    const VPickWindow Window( io_rContext );
    io_rPicked.Clear();
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      const std::uint32_t Id = i_rShapes.Id( Index );
      if ( Id == 0 || !i_rShapes.Make( Index, Geometry ) )
      {
        continue;
      }
      if constexpr ( requires { TShapes::Widen( Geometry, 0.0F ); } )
      {
        TShapes::Widen( Geometry, Window.Drawn( 0, Window.Depth( Geometry[9], Geometry[10], Geometry[11] ) ) );
      }
      if ( Reaches( Window, Geometry ) && !i_rScene.IsIgnored( Id ) )
      {
        io_rPicked.Add( Id, i_rShapes.Flags( Index ), Geometry );
      }
    }
    io_rPicked.Draw( io_rContext, io_rLook, i_rPrepare );
    return;
  }
  if ( io_rState.MarkedKey != i_rKey )
  {
    io_rState.MarkedKey = i_rKey;
    io_rState.Marked.Clear();
    for ( std::size_t Index = 0; Index < Count; ++Index )
    {
      const std::uint8_t Flags = i_rShapes.Flags( Index );
      if ( ( Flags & Marks ) != 0 && i_rShapes.Id( Index ) != 0 && i_rShapes.Make( Index, Geometry ) )
      {
        io_rState.Marked.Add( i_rShapes.Id( Index ), Flags, Geometry );
      }
    }
  }
  io_rState.Marked.Draw( io_rContext, io_rLook, i_rPrepare );
}

/// What is seen of a kind whose instances hold their colours; returns how many that is.
template < typename TShapes >
std::size_t DrawSeen( CoreGraphics::VRenderContext& io_rContext, VSubjectLook& io_rLook, VHeldInstances& io_rHeld,
                      const TShapes& i_rShapes, const VInstanceKey& i_rKey, std::size_t i_Bound )
{
  using VKind = VInstance< typename TShapes::VGeometry >;
  const bool bFed =
      io_rHeld.Feed< VKind >( i_rKey, i_Bound,
                              [&]( VKind* o_pInstances )
                              {
                                std::size_t Count = 0;
                                VKind Made;
                                for ( std::size_t Index = 0; Index < i_rShapes.Count() && Count < i_Bound; ++Index )
                                {
                                  if ( i_rShapes.Make( Index, Made.Geometry ) )
                                  {
                                    Made.Word = i_rShapes.Colour( Index );
                                    o_pInstances[Count++] = Made;
                                  }
                                }
                                return VFilled{ Count, Count };
                              } );
  if ( !bFed || io_rHeld.Count() == 0 || !io_rLook.Programs.Use( io_rContext, 0 ) )
  {
    return 0;
  }
  const CoreGraphics::VVertexStream Streams[] = { io_rLook.MeshStream(), { &io_rHeld.Buffer(), io_rLook.pSeen, 0 } };
  if ( !io_rContext.SetVertexStreams( Streams ) )
  {
    return 0;
  }
  io_rContext.SetRenderState( io_rLook.State );
  io_rContext.DrawElementsInstanced( GL_TRIANGLES, *io_rLook.pMesh, static_cast< int >( io_rHeld.Count() ) );
  return io_rHeld.Shown();
}

// Layouts of instances, with colours and with flags.
const CoreGraphics::VVertexLayout& SeenPlaceLayout();
const CoreGraphics::VVertexLayout& PickedPlaceLayout();
const CoreGraphics::VVertexLayout& SeenColumnsLayout();
const CoreGraphics::VVertexLayout& PickedColumnsLayout();
const CoreGraphics::VVertexLayout& PickedEndsLayout();

/// Solid things: back faces are not drawn.
CoreGraphics::VRenderState SolidState();
/// The same, blended over what is there.
CoreGraphics::VRenderState BlendedState();

} // namespace MoxelGraphics
