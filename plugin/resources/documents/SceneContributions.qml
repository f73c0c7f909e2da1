import QtQuick

// Which cameras see the selection, or what the selected cameras contribute to: a line that opens to a list with the
// error of each. While the list is open the rays are drawn.
Rectangle {
    id: root

    property var contributions: null
    property Item sceneItem: null
    property bool open: false
    property int mostHeight: 320
    readonly property bool known: contributions !== null && contributions.selected > 0
    readonly property int margin: 8
    property bool raysAreOurs: false
    // Which contributions count this list among those who watch, and whether for the rows too.
    property var watched: null
    property bool rowsWatched: false

    // The camera that was clicked in the list.
    signal cameraClicked(string urn)

    // `ContributionsType`: none, and those of whatever is selected.
    readonly property int noRays: 0
    readonly property int raysOfSelection: 3

    function showRays(on) {
        if (!sceneItem)
            return
        if (on && sceneItem.sceneOptions["ContributionsType"] === noRays) {
            sceneItem.setOption("ContributionsType", raysOfSelection)
            raysAreOurs = true
        } else if (!on && raysAreOurs) {
            sceneItem.setOption("ContributionsType", noRays)
            raysAreOurs = false
        }
    }

    function watch(what, rows) {
        const before = watched, beforeRows = rowsWatched
        if (before === what && beforeRows === rows)
            return
        watched = what
        rowsWatched = rows
        if (what)
            rows ? what.watchRows() : what.watch()
        if (before)
            beforeRows ? before.unwatchRows() : before.unwatch()
    }

    visible: known
    width: 230
    height: Math.min(mostHeight, column.height + 2 * margin)
    radius: 5
    color: "#C0181A1C"
    border.color: open ? "#E76500" : "#40FFFFFF"
    clip: true

    // Without a selection that type would show the rays of everything.
    onOpenChanged: {
        showRays(open && known)
        watch(contributions, open)
    }
    onKnownChanged: showRays(open && known)
    onContributionsChanged: watch(contributions, open)
    Component.onDestruction: {
        showRays(false)
        watch(null, false)
    }

    Column {
        id: column

        x: root.margin
        y: root.margin
        width: root.width - 2 * root.margin
        spacing: 4

        Text {
            objectName: "contributionsSummary"
            width: parent.width
            text: root.known ? root.contributions.summary + (root.open ? "" : "  ▸") : ""
            textFormat: Text.PlainText
            wrapMode: Text.Wrap
            color: "#DCDFE4"
            font.pixelSize: 12
            font.weight: Font.Medium
        }

        ListView {
            objectName: "contributionsList"
            width: parent.width
            height: Math.min(contentHeight, root.mostHeight - 60)
            visible: root.open && count > 0
            clip: true
            model: root.known && root.open ? root.contributions.rows : []

            delegate: Item {
                required property var modelData

                width: ListView.view.width
                height: 18

                Rectangle {
                    id: dot

                    anchors.verticalCenter: parent.verticalCenter
                    width: 8
                    height: 8
                    radius: 4
                    color: modelData.color
                }

                Text {
                    anchors.left: dot.right
                    anchors.leftMargin: 6
                    anchors.right: value.left
                    anchors.rightMargin: 6
                    anchors.verticalCenter: parent.verticalCenter
                    elide: Text.ElideRight
                    textFormat: Text.PlainText
                    text: root.contributions.ofCameras || root.contributions.selected > 1
                          ? (root.contributions.ofCameras ? "" : modelData.urn + "  ")
                            + (modelData.label !== "" ? modelData.label : qsTr("Reconstruction %1").arg(modelData.id))
                          : modelData.urn
                    color: "#B4B8BE"
                    font.pixelSize: 11
                }

                Text {
                    id: value

                    anchors.right: parent.right
                    anchors.verticalCenter: parent.verticalCenter
                    text: modelData.errorText
                    textFormat: Text.PlainText
                    color: modelData.color
                    font.pixelSize: 11
                }

                TapHandler {
                    onTapped: root.cameraClicked(modelData.urn)
                }
            }
        }
    }

    MouseArea {
        anchors.left: parent.left
        anchors.right: parent.right
        height: 24
        onClicked: root.open = !root.open
    }
}
