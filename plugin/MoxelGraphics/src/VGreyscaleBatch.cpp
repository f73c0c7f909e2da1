#include "VGreyscaleBatch.h"

#include "Log.h"

#include <MoxelGraphics/VMoxelScene.h>

#include <CoreGraphics/VRenderContext.h>

#include <algorithm>
#include <cmath>
#include <cstring>

namespace MoxelGraphics
{
namespace
{
using ZEK::VGreyscaleData;
using ZEK::VGreyscaleSpan;

/// As the device reads it. A line's number is a float there, and exact up to `MostLines`.
struct VRecord
{
  std::uint16_t Left, Top, Right, Bottom;
  std::uint32_t FirstLine;
  std::uint16_t Tile, Unused;
};
static_assert( sizeof( VRecord ) == VGreyscaleBatch::RecordBytes && sizeof( VGreyscaleSpan ) == 8 );
constexpr std::size_t MostLines = 1u << 24;

bool IsUsable( const std::array< float, 4 >& i_rImage )
{
  return std::all_of( i_rImage.begin(), i_rImage.end(),
                      []( float i_Value )
                      {
                        return std::isfinite( i_Value );
                      } ) &&
         i_rImage[2] != 0 && i_rImage[3] != 0;
}

/// How large the tables of a set are, in bytes.
struct VTables
{
  std::size_t Lines = 0, Pixels = 0;

  VTables With( const VGreyscaleData& i_rData ) const
  {
    return { Lines + i_rData.Lines.size() * sizeof( VGreyscaleSpan ), Pixels + i_rData.Pixels.size() };
  }
  bool AreBuffers( const CoreGraphics::VRenderContext& i_rContext ) const
  {
    using namespace CoreGraphics;
    return VTexelBuffer::Fits( i_rContext, ETexelWords, Lines ) && VTexelBuffer::Fits( i_rContext, ETexelByte, Pixels );
  }
};
} // namespace

const CoreGraphics::VVertexLayout& VGreyscaleBatch::RecordLayout()
{
  using namespace CoreGraphics;
  static const VVertexLayout Layout( sizeof( VRecord ), 1,
                                     { { EAttributePosition, 4, GL_UNSIGNED_SHORT, false, 0 },
                                       { EAttributeNormal, 1, GL_UNSIGNED_INT, false, offsetof( VRecord, FirstLine ) },
                                       { EAttributeTile, 1, GL_UNSIGNED_SHORT, false, offsetof( VRecord, Tile ) } } );
  return Layout;
}

void VGreyscaleBatch::Count( CoreGraphics::VRenderContext& io_rContext, VGreyscaleSet& io_rSet,
                             std::span< const ZEK::VCameraLists2D > i_Lists )
{
  using namespace CoreGraphics;
  const std::size_t MostLineBytes = VTexelBuffer::MostTextureBytes( io_rContext, ETexelWords );
  const std::size_t MostPixels = VTexelBuffer::MostTextureBytes( io_rContext, ETexelByte );
  io_rSet.Total = 0;
  VTables Tables;
  for ( std::size_t Slot = 0; Slot < i_Lists.size(); ++Slot )
  {
    const VGreyscaleData& rData = *i_Lists[Slot].pGreyscale;
    VTileSlot& rSlot = io_rSet.Slots[Slot];
    rSlot.First = static_cast< std::uint32_t >( io_rSet.Total );
    rSlot.Count = 0;
    rSlot.Image = rData.OffsetScale;
    if ( rData.Records.empty() || !IsUsable( rData.OffsetScale ) )
    {
      continue;
    }
    const VTables Larger = Tables.With( rData );
    const bool bTextures = Larger.Lines <= MostLineBytes && Larger.Pixels <= MostPixels;
    if ( Larger.Lines > MostLines * sizeof( VGreyscaleSpan ) || !( bTextures || Larger.AreBuffers( io_rContext ) ) )
    {
      if ( !std::exchange( m_bSaid, true ) )
      {
        ZEK::Log( LogCategory(), ZEK::ELogWarning,
                  "The grey of \"%1%\" is not shown: with it there is more than the device holds", rSlot.Name );
      }
      continue;
    }
    Tables = Larger;
    rSlot.Count = static_cast< std::uint32_t >( rData.Records.size() );
    io_rSet.Total += rSlot.Count;
  }
}

bool VGreyscaleBatch::Write( CoreGraphics::VRenderContext& io_rContext, VTileSet& io_rSet,
                             std::span< const ZEK::VCameraLists2D > i_Lists )
{
  VGreyscaleSet& rSet = static_cast< VGreyscaleSet& >( io_rSet );
  Count( io_rContext, rSet, i_Lists );
  if ( rSet.Total == 0 )
  {
    return true;
  }
  auto* pRecord = static_cast< VRecord* >( rSet.Records.Map( rSet.Total * sizeof( VRecord ) ) );
  if ( !pRecord )
  {
    return false;
  }
  std::uint32_t FirstLine = 0;
  for ( std::size_t Slot = 0; Slot < i_Lists.size(); ++Slot )
  {
    if ( rSet.Slots[Slot].Count == 0 )
    {
      continue;
    }
    const VGreyscaleData& rData = *i_Lists[Slot].pGreyscale;
    for ( const ZEK::VGreyscaleRecord& rRecord : rData.Records )
    {
      *pRecord++ = { rRecord.Left,
                     rRecord.Top,
                     rRecord.Right,
                     rRecord.Bottom,
                     FirstLine + rRecord.FirstLine,
                     static_cast< std::uint16_t >( Slot ),
                     0 };
    }
    FirstLine += static_cast< std::uint32_t >( rData.Lines.size() );
  }
  return rSet.Records.Unmap() && WriteTables( io_rContext, rSet, i_Lists );
}

bool VGreyscaleBatch::WriteTables( CoreGraphics::VRenderContext& io_rContext, VGreyscaleSet& io_rSet,
                                   std::span< const ZEK::VCameraLists2D > i_Lists )
{
  using namespace CoreGraphics;
  VTables Tables;
  for ( std::size_t Slot = 0; Slot < i_Lists.size(); ++Slot )
  {
    if ( io_rSet.Slots[Slot].Count > 0 )
    {
      Tables = Tables.With( *i_Lists[Slot].pGreyscale );
    }
  }
  const bool bBuffers = Tables.AreBuffers( io_rContext );
  auto* pLine = static_cast< VGreyscaleSpan* >( io_rSet.Lines.Map( io_rContext, Tables.Lines, bBuffers ) );
  auto* const pPixels = static_cast< std::uint8_t* >( io_rSet.Pixels.Map( io_rContext, Tables.Pixels, bBuffers ) );
  std::uint32_t FirstPixel = 0;
  for ( std::size_t Slot = 0; pLine && pPixels && Slot < i_Lists.size(); ++Slot )
  {
    if ( io_rSet.Slots[Slot].Count == 0 )
    {
      continue;
    }
    const VGreyscaleData& rData = *i_Lists[Slot].pGreyscale;
    for ( const VGreyscaleSpan& rLine : rData.Lines )
    {
      *pLine++ = { rLine.X, rLine.Length, rLine.FirstByte + FirstPixel };
    }
    std::memcpy( pPixels + FirstPixel, rData.Pixels.data(), rData.Pixels.size() );
    FirstPixel += static_cast< std::uint32_t >( rData.Pixels.size() );
  }
  const bool bLines = pLine && io_rSet.Lines.Unmap( io_rContext );
  const bool bPixels = pPixels && io_rSet.Pixels.Unmap( io_rContext );
  return bLines && bPixels;
}

void MakeBlobWords( const ZEK::IRenderCamera& i_rCamera, const ZEK::VGreyscaleData& i_rData, VMoxelScene& io_rScene,
                    std::vector< std::uint32_t >& o_rWords )
{
  const std::uint32_t First = i_rCamera.GetInfo().FirstBlobId;
  o_rWords.resize( i_rData.Blobs.size() );
  std::transform( i_rData.Blobs.begin(), i_rData.Blobs.end(), o_rWords.begin(),
                  [&]( std::uint32_t i_Blob )
                  {
                    const std::uint32_t Id = First == 0 ? 0 : First + i_Blob;
                    return io_rScene.IsIgnored( Id ) ? 0 : Id;
                  } );
  for ( const VSelectionRegistry::VMark& rMark : io_rScene.Registry().Marks() )
  {
    if ( rMark.Item.Kind != ZEK::ESelectGreyscaleBlob || rMark.Item.Device != i_rCamera.GetName() )
    {
      continue;
    }
    for ( std::size_t Record = 0; Record < o_rWords.size(); ++Record )
    {
      o_rWords[Record] |= i_rData.Blobs[Record] == rMark.Item.Sub && o_rWords[Record] != 0 ? rMark.Flags : 0;
    }
  }
}

bool VGreyscaleBatch::WriteWords( VGreyscaleSet& io_rSet, VMoxelScene& io_rScene, int i_Scheme )
{
  const std::uint64_t Provider = io_rScene.IgnoredIds().empty() ? m_pProvider->GetGeneration() : 0;
  if ( Provider != 0 && io_rSet.WordsProvider == Provider && io_rSet.WordsSerial == io_rSet.Serial &&
       io_rSet.Words.Bind() )
  {
    return true;
  }
  io_rSet.WordsProvider = 0;
  auto* pWord = static_cast< std::uint32_t* >( io_rSet.Words.Map( io_rSet.Total * sizeof( std::uint32_t ) ) );
  if ( !pWord )
  {
    return false;
  }
  ZEK::VCameraLists2D Lists;
  ZEK::VDrawWords Colours;
  for ( const VTileSlot& rSlot : std::span( io_rSet.Slots ).first( io_rSet.SlotCount ) )
  {
    const ZEK::VRenderCameraRef pCamera = m_pProvider->GetCamera( rSlot.Name );
    m_Words.clear();
    if ( pCamera )
    {
      pCamera->GetDrawData2D( pCamera->GetInfo().FirstCentroidId, static_cast< ZEK::ECentroidColourScheme >( i_Scheme ),
                              true, Lists, Colours );
      MakeBlobWords( *pCamera, *Lists.pGreyscale, io_rScene, m_Words );
    }
    m_Words.resize( rSlot.Count, 0 );
    pWord = std::copy( m_Words.begin(), m_Words.end(), pWord );
  }
  if ( !io_rSet.Words.Unmap() )
  {
    return false;
  }
  io_rSet.WordsProvider = Provider;
  io_rSet.WordsSerial = io_rSet.Serial;
  return true;
}

} // namespace MoxelGraphics
