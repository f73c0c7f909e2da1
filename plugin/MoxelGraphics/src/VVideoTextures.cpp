#include "VVideoTextures.h"

#include "Log.h"

#include <CoreGraphics/VRenderContext.h>
#include <CoreVideoUtils/ConvertVideo.h>

#include <QtGui/QOpenGLContext>

#include <algorithm>
#include <iterator>

namespace MoxelGraphics
{
using namespace CoreMoxelTypes;
using CoreVideoUtils::EPixelFamily;

namespace
{
ETexel TexelOf( EPixelFormat i_Format, std::size_t i_Plane )
{
  switch ( i_Format )
  {
  case EPixelFormat::Luminance16:
    return ETexel::RG8;
  case EPixelFormat::YUYV:
  case EPixelFormat::UYVY:
    return ETexel::RGBA8;
  case EPixelFormat::NV12:
    return i_Plane == 0 ? ETexel::R8 : ETexel::RG8;
  default:
    return ETexel::R8;
  }
}

u32 Odd( u32 i_Count )
{
  return i_Count & 1;
}
} // namespace

bool VVideoTextures::IsHeld( const CoreGraphics::VRenderContext& i_rContext, const VVideoFrame& i_rFrame ) const
{
  const auto Equal = []( const u32( &i_rA )[3], const u32( &i_rB )[3] )
  {
    return std::equal( std::begin( i_rA ), std::end( i_rA ), std::begin( i_rB ) );
  };
  // The data are held, so that their address can be nobody else's.
  return m_Result.Code() != ZEK::IResult::NotSet && m_Frame.Data == i_rFrame.Data &&
         m_Frame.Format == i_rFrame.Format && m_Frame.Width == i_rFrame.Width && m_Frame.Height == i_rFrame.Height &&
         Equal( m_Frame.Stride, i_rFrame.Stride ) && Equal( m_Frame.Offset, i_rFrame.Offset ) &&
         ( m_Result.IsError() || m_Textures[0].IsThere( i_rContext ) );
}

ZEK::IResult VVideoTextures::Take( CoreGraphics::VRenderContext& io_rContext, const VVideoFrame& i_rFrame )
{
  const bool bHeld = IsHeld( io_rContext, i_rFrame );
  m_Frame = i_rFrame;
  if ( bHeld )
  {
    return m_Result;
  }
  CoreVideoUtils::VVideoPlanes Planes;
  m_Result = CoreVideoUtils::FindPlanes( i_rFrame, Planes );
  for ( std::size_t Index = 0; m_Result.IsOk() && Index < Planes.Count; ++Index )
  {
    const CoreVideoUtils::VVideoPlane& rPlane = Planes.Planes[Index];
    const ETexel Texel = TexelOf( i_rFrame.Format, Index );
    const std::size_t Columns = rPlane.RowBytes / static_cast< std::size_t >( Texel );
    if ( !m_Textures[Index].Write( io_rContext, Texel, static_cast< int >( Columns ), static_cast< int >( rPlane.Rows ),
                                   rPlane.pData, rPlane.Stride ) )
    {
      m_Result = ZEK::IResult::NotSupported;
    }
    m_BytesWritten += m_Result.IsOk() ? rPlane.RowBytes * rPlane.Rows : 0;
  }
  return m_Result;
}

void VVideoTextures::Free()
{
  for ( VTexture& rTexture : m_Textures )
  {
    rTexture.Free();
  }
  m_Frame = {};
  m_Result = ZEK::IResult::NotSet;
}

void VVideoTextures::Bind( CoreGraphics::VRenderContext& io_rContext ) const
{
  const EPixelFormat Format = m_Frame.Format;
  const int Planes = Format == EPixelFormat::I420 ? 3 : Format == EPixelFormat::NV12 ? 2 : 1;
  for ( int Unit = Planes - 1; Unit >= 0; --Unit )
  {
    m_Textures[static_cast< std::size_t >( Unit )].Bind( io_rContext, Unit );
  }
}

std::uint32_t VVideoTextures::TextureColumns() const
{
  return CoreVideoUtils::FamilyOf( m_Frame.Format ) == EPixelFamily::YUV ? m_Frame.Width + Odd( m_Frame.Width )
                                                                         : m_Frame.Width;
}

QVector2D VVideoTextures::ChromaTrim() const
{
  const auto Trim = []( u32 i_Count )
  {
    return static_cast< float >( Odd( i_Count ) ) / static_cast< float >( i_Count + Odd( i_Count ) );
  };
  return { Trim( m_Frame.Width ), Trim( m_Frame.Height ) };
}

void VImageTextures::Take( CoreGraphics::VRenderContext& io_rContext, const VImageSet& i_rSet, std::uint64_t i_Id,
                           const QString& i_rExpression )
{
  QOpenGLContextGroup* const pGroup = io_rContext.Context()->shareGroup();
  if ( !m_bTaken || m_Id != i_Id || m_pGroup != pGroup )
  {
    Free();
    m_Textures.resize( i_rSet.Images.size() );
  }
  else if ( m_Expression == i_rExpression )
  {
    return;
  }
  m_bTaken = true;
  m_Id = i_Id;
  m_pGroup = pGroup;
  m_Expression = i_rExpression;
  m_Found.clear();
  CoreVideoUtils::VRgbaPicture Picture;
  for ( std::size_t Index = 0; Index < i_rSet.Images.size(); ++Index )
  {
    const VImageSet::I& rImage = i_rSet.Images[Index];
    std::unique_ptr< VTexture >& rpTexture = m_Textures[Index];
    if ( !QString::fromStdString( rImage.Tag ).contains( i_rExpression, Qt::CaseInsensitive ) )
    {
      continue;
    }
    if ( !rpTexture )
    {
      rpTexture = std::make_unique< VTexture >();
      ZEK::IResult Result = CoreVideoUtils::ImageToRgba( rImage, Picture );
      if ( Result.IsOk() && !rpTexture->Write( io_rContext, ETexel::RGBA8, static_cast< int >( Picture.Width ),
                                               static_cast< int >( Picture.Height ), Picture.Pixels.data(),
                                               std::size_t{ 4 } * Picture.Width ) )
      {
        Result = ZEK::IResult::NotSupported;
      }
      if ( Result.IsError() )
      {
        ZEK::Log( LogCategory(), ZEK::ELogWarning, "The image \"%1%\" cannot be shown: %2%", rImage.Tag,
                  Result.Text() );
      }
      m_BytesWritten += Result.IsOk() ? Picture.Pixels.size() : 0;
    }
    if ( rpTexture->IsThere( io_rContext ) )
    {
      m_Found.push_back( rpTexture.get() );
    }
  }
}

void VImageTextures::Free()
{
  m_Found.clear();
  m_Textures.clear();
  m_bTaken = false;
}

} // namespace MoxelGraphics
