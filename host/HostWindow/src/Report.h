#pragma once

#include <HostWindow/CommandLine.h>
#include <HostWindow/SceneView.h>
#include <HostWindow/Session.h>

#include <QtCore/QJsonArray>
#include <QtCore/QJsonObject>

namespace HostWindow
{

/// One of the two sets of the selection service, oldest first.
QJsonArray DescribeSelection( const HostServices::VSelectionService& i_rService, ZEK::ISelectionService::ESet i_Set );

/// What an item is called where people read it: the object's own name, or its kind and number.
QString SelectionLabel( const ZEK::VSelectionItem& i_rItem );

/// What an action did: its option and text, and what is selected and under the pointer after it.
QJsonObject DescribeAction( const VViewAction& i_rAction, VSession& i_rSession, const VSceneView& i_rView );

/// The whole report but the actions.
QJsonObject DescribeView( VSession& i_rSession, const VRenderOptions& i_rRender, const std::string& i_rWindow,
                          const VSceneView& i_rView, const QImage& i_rPicture );

} // namespace HostWindow
