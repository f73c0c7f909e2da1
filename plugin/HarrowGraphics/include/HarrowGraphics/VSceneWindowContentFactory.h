#pragma once

#include <HarrowGraphics/VQMLSceneWidget.h>
#include <HarrowPluginInterface/IHarrowApplication.h>
#include <HarrowPluginInterface/IHarrowWorkspace.h>

namespace HarrowGraphics
{

class VSceneManager;

/// Makes the windows of one kind. The application and the workspace outlive it. Thread: GUI.
class VSceneWindowContentFactory : public HarrowPluginInterface::IWorkspaceContentFactory,
                                   public std::enable_shared_from_this< VSceneWindowContentFactory >
{
public:
  VSceneWindowContentFactory( HarrowPluginInterface::IHarrowApplication& io_rApplication,
                              HarrowPluginInterface::IHarrowWorkspace& io_rWorkspace, std::string i_Name,
                              std::shared_ptr< VSceneManager > i_pSceneManager, EWindowKind i_Kind );

  void Create( std::shared_ptr< HarrowPluginInterface::VWindowFrameContent >& o_rpContent,
               const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext,
               const QPointer< QWidget >& i_rpToolbar ) override;

private:
  void MakeSubjectScene( const std::shared_ptr< HarrowPluginInterface::IStateCacheContext >& i_rpContext,
                         VSceneWidgetArguments& io_rArguments );

  HarrowPluginInterface::IHarrowApplication& m_rApplication;
  HarrowPluginInterface::IHarrowWorkspace& m_rWorkspace;
  std::string m_Name;
  std::shared_ptr< VSceneManager > m_pSceneManager;
  EWindowKind m_Kind;
};

} // namespace HarrowGraphics
