#include "MeshPictures.h"

#include <assimp/material.h>
#include <assimp/scene.h>

#include <QtCore/QBuffer>
#include <QtGui/QImage>
#include <QtGui/QImageReader>

#include <cstring>
#include <system_error>

namespace HostMeshes
{
namespace
{
using HarrowPluginInterface::VMeshPicture;

constexpr int LongestSide = 8192;

std::shared_ptr< const VMeshPicture > ToPicture( const QImage& i_rImage )
{
  if ( i_rImage.isNull() )
  {
    return nullptr;
  }
  const QImage Image = i_rImage.convertToFormat( QImage::Format_RGBA8888 );
  auto pPicture = std::make_shared< VMeshPicture >();
  pPicture->Width = Image.width();
  pPicture->Height = Image.height();
  const std::size_t Row = std::size_t{ 4 } * static_cast< std::size_t >( Image.width() );
  pPicture->Pixels.resize( Row * static_cast< std::size_t >( Image.height() ) );
  for ( int Line = 0; Line < Image.height(); ++Line )
  {
    std::memcpy( pPicture->Pixels.data() + Row * static_cast< std::size_t >( Line ), Image.constScanLine( Line ), Row );
  }
  return pPicture;
}

std::shared_ptr< const VMeshPicture > Read( QImageReader& io_rReader )
{
  const QSize Size = io_rReader.size();
  if ( Size.width() > LongestSide || Size.height() > LongestSide )
  {
    return nullptr;
  }
  return ToPicture( io_rReader.read() );
}

std::shared_ptr< const VMeshPicture > ReadPacked( const aiTexture& i_rTexture )
{
  const auto Width = static_cast< int >( i_rTexture.mWidth ), Height = static_cast< int >( i_rTexture.mHeight );
  if ( !i_rTexture.pcData || Width <= 0 )
  {
    return nullptr;
  }
  if ( Height == 0 )
  {
    QByteArray Bytes = QByteArray::fromRawData( reinterpret_cast< const char* >( i_rTexture.pcData ), Width );
    QBuffer Buffer( &Bytes );
    QImageReader Reader( &Buffer );
    return Read( Reader );
  }
  if ( Height < 0 || Width > LongestSide || Height > LongestSide )
  {
    return nullptr;
  }
  // Texels lie as blue, green, red, alpha.
  return ToPicture( QImage( reinterpret_cast< const uchar* >( i_rTexture.pcData ), Width, Height, 4 * Width,
                            QImage::Format_ARGB32 ) );
}

/// The file that a texture's path means, which is often one of the machine that wrote it: by its last name.
std::filesystem::path FindFile( std::string i_Path, const std::filesystem::path& i_rFolder )
{
  std::replace( i_Path.begin(), i_Path.end(), '\\', '/' );
  const std::filesystem::path Path = std::filesystem::path( i_Path ).lexically_normal();
  const bool bBelow = Path.is_relative() && !Path.empty() && *Path.begin() != "..";
  std::error_code Error;
  for ( const std::filesystem::path& rTry : { bBelow ? i_rFolder / Path : std::filesystem::path(),
                                              i_rFolder / Path.filename(), i_rFolder / "textures" / Path.filename() } )
  {
    if ( !rTry.empty() && std::filesystem::is_regular_file( rTry, Error ) )
    {
      return rTry;
    }
  }
  return {};
}
} // namespace

std::shared_ptr< const VMeshPicture > ReadPicture( const aiScene& i_rScene, const aiMaterial& i_rMaterial,
                                                   const std::filesystem::path& i_rFolder )
{
  aiString Path;
  if ( i_rMaterial.GetTexture( aiTextureType_DIFFUSE, 0, &Path ) != aiReturn_SUCCESS || Path.length == 0 )
  {
    return nullptr;
  }
  if ( const aiTexture* const pPacked = i_rScene.GetEmbeddedTexture( Path.C_Str() ) )
  {
    return ReadPacked( *pPacked );
  }
  const std::filesystem::path File = i_rFolder.empty() ? i_rFolder : FindFile( Path.C_Str(), i_rFolder );
  if ( File.empty() )
  {
    return nullptr;
  }
  QImageReader Reader( QString::fromStdU16String( File.u16string() ) );
  return Read( Reader );
}

} // namespace HostMeshes
