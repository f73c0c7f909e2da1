#pragma once

#include <CoreGraphics/VShaderProgram.h>

#include <QtCore/QPointer>
#include <QtGui/QOpenGLContextGroup>

#include <cstdint>
#include <filesystem>
#include <map>
#include <memory>
#include <string>
#include <tuple>
#include <vector>

namespace HarrowPluginInterface
{
class IRenderResources;
}

namespace CoreGraphics
{

/// Finds GLSL sources by base name and caches shaders and programs, one set for all views of a scene. Sources in
/// the host's override folders win over the built-in ones. Thread: render thread with a context current.
class VResources
{
public:
  /// Null: no override folders and no reloading.
  explicit VResources( std::shared_ptr< HarrowPluginInterface::IRenderResources > i_pHost = nullptr );
  ~VResources();
  VResources( const VResources& ) = delete;
  VResources& operator=( const VResources& ) = delete;

  /// Called by the first frame of each view. False, with a line in the log, when the current context does not share
  /// objects with the one that was first: nothing can be drawn in it. After the share group of the first died, all
  /// programs that are held anywhere are built again for the current one.
  bool Prepare();
  /// Called at the start of each frame: rereads the sources when the host asked for it. True when it did.
  bool Update();
  /// Rereads all sources. What did not change is left alone; what changed is compiled and its programs are linked
  /// again in place.
  void Reload();

  /// The program of that pair, made on first use. It is never null; `IsUsable` may be false. With no context
  /// current it is an unusable one that `Prepare` completes.
  std::shared_ptr< VShaderProgram > GetProgram( const std::string& i_rVertexName, const std::string& i_rFragmentName,
                                                EShaderForm i_Form = EFormSingle );

  EShaderDialect Dialect() const { return m_Dialect; }
  /// The words on a context below the minimum, to be shown in the view; empty when it is good enough.
  const std::string& VersionNotice() const { return m_VersionNotice; }
  /// False when the device has too few uniform vectors for skinning by `FBXSkin`.
  bool HasSkinning() const { return m_bSkinning; }

  /// The words for a context of that version; empty when it is good enough.
  static std::string VersionText( bool i_bES, int i_Major, int i_Minor );

private:
  using VFileMap = std::map< std::string, QString >;
  using VShaderKey = std::tuple< EShaderType, std::string, EShaderForm >;
  using VProgramKey = std::tuple< std::string, std::string, EShaderForm >;

  void ReadContext();
  void Scan();
  void ScanFolder( const QString& i_rFolder );
  void Rebuild( bool i_bForce );
  QString FindFile( EShaderType i_Type, const std::string& i_rName ) const;
  std::shared_ptr< VShader > FindShader( EShaderType i_Type, const std::string& i_rName, EShaderForm i_Form );

  std::shared_ptr< HarrowPluginInterface::IRenderResources > m_pHost;
  QPointer< QOpenGLContextGroup > m_pGroup;
  bool m_bPrepared = false;
  std::uint64_t m_Generation = 0;
  EShaderDialect m_Dialect = EDialectES300;
  std::string m_VersionNotice;
  bool m_bSkinning = true;
  VFileMap m_VertexFiles;
  VFileMap m_FragmentFiles;
  std::map< VShaderKey, std::shared_ptr< VShader > > m_Shaders;
  std::map< VProgramKey, std::shared_ptr< VShaderProgram > > m_Programs;
};

} // namespace CoreGraphics
