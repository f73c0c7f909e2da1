import QtQuick

// What stands over the image of one camera: who it is, whether it is selected, what is wrong with it. What has no room
// is left out; `summary` has all of it.
Item {
    id: root

    required property var tileRect
    required property string tileUserId
    required property string tileDisplayType
    required property string tileDeviceURN
    required property bool tileVideo
    required property bool tileVideoInput
    required property bool tileVideoFile
    required property var tileSelectionItem
    required property var tileAdditionalData
    property bool loaderCompact: false
    property bool hovered: false
    property color accent: "#E76500"

    readonly property bool selected: tileSelectionItem !== undefined && tileSelectionItem !== null
    readonly property var knowledge: tileAdditionalData || ({})
    readonly property string number: tileUserId === "" || tileUserId === "-1" || tileUserId === "4294967295"
                                     ? "–" : tileUserId
    readonly property string mark: tileVideoFile ? qsTr("FILE") : tileVideoInput ? qsTr("INPUT")
                                                : tileVideo ? qsTr("VIDEO") : ""
    readonly property int margin: Math.min(width, height) < 110 ? 4 : 9
    readonly property bool complete: title.visible && (tileDisplayType === "" || displayType.visible) && urn.visible
                                     && (mark === "" || pill.visible) && warnings.complete
                                     && (!error.known || error.visible)
    readonly property string summary: [
        "<b>" + number + "</b> " + escaped(tileDisplayType), escaped(tileDeviceURN), mark,
        error.known ? qsTr("Reprojection error %1").arg(error.text) : ""
    ].concat(warnings.warnings.map(w => escaped(w.text))).filter(t => t.trim() !== "").join("<br>")

    function escaped(text) {
        return text.replace(/&/g, "&amp;").replace(/</g, "&lt;")
    }

    x: tileRect.x
    y: tileRect.y
    width: tileRect.width
    height: tileRect.height
    clip: true

    Rectangle {
        anchors.fill: parent
        color: "transparent"
        border.width: root.selected ? 2 : 1
        border.color: root.selected ? root.accent : root.hovered ? "#80FFFFFF" : "#20FFFFFF"
    }

    Rectangle {
        objectName: "contributes"
        anchors.fill: parent
        anchors.margins: 3
        visible: root.knowledge.contributes === true
        color: "transparent"
        border.width: 2
        border.color: visible ? root.knowledge.errorColor : "transparent"

        Text {
            anchors.horizontalCenter: parent.horizontalCenter
            anchors.bottom: parent.bottom
            anchors.bottomMargin: 3
            visible: text !== "" && implicitWidth + 8 <= parent.width
            text: root.knowledge.error !== undefined ? qsTr("%1 px").arg(root.knowledge.error.toFixed(2)) : ""
            color: parent.border.color
            style: Text.Outline
            styleColor: "#70000000"
            font.pixelSize: 12
        }
    }

    Text {
        id: title

        x: root.margin
        y: root.margin - 2
        visible: implicitWidth + 2 * x <= root.width && implicitHeight + 2 * y <= root.height
        text: root.number
        textFormat: Text.PlainText
        color: root.selected ? root.accent : "#DCDFE4"
        style: Text.Outline
        styleColor: "#70000000"
        font.pixelSize: Math.max(12, Math.min(26, Math.round(Math.min(root.width * 0.1, root.height * 0.09))))
        font.weight: Font.Medium
    }

    Text {
        id: displayType

        anchors.left: title.right
        anchors.leftMargin: 8
        anchors.baseline: title.baseline
        visible: title.visible && text !== ""
                 && x + implicitWidth + root.margin + (root.mark === "" ? 0 : pill.width + 8) <= root.width
        text: root.tileDisplayType
        textFormat: Text.PlainText
        color: "#B4B8BE"
        style: Text.Outline
        styleColor: "#70000000"
        font.pixelSize: Math.max(11, Math.round(title.font.pixelSize * 0.5))
    }

    Rectangle {
        id: pill

        anchors.right: parent.right
        anchors.rightMargin: root.margin
        anchors.verticalCenter: title.verticalCenter
        visible: title.visible && root.mark !== "" && root.width >= 120
                 && title.x + title.implicitWidth + 8 + width + root.margin <= root.width
        width: pillText.implicitWidth + 10
        height: 15
        radius: 3
        color: "#70101214"
        border.color: "#60FFFFFF"

        Text {
            id: pillText

            anchors.centerIn: parent
            text: root.mark
            color: "#C8CCD2"
            font.pixelSize: 9
            font.letterSpacing: 0.8
        }
    }

    Text {
        id: urn

        x: root.margin
        anchors.top: title.bottom
        visible: (root.hovered || root.selected) && title.visible && implicitWidth + 2 * x <= root.width
                 && y + implicitHeight < warnings.y
        text: root.tileDeviceURN
        textFormat: Text.PlainText
        color: "#B4B8BE"
        style: Text.Outline
        styleColor: "#70000000"
        font.pixelSize: 11
    }

    CameraWarnings {
        id: warnings

        x: root.margin
        y: root.height - root.margin - height
        visible: y >= (title.visible ? title.y + title.height : 0)
        additionalData: root.knowledge
        loaderCompact: root.loaderCompact
        availableWidth: root.width - 2 * x - (error.visible ? error.width + 8 : 0)
        availableHeight: root.height - 2 * root.margin - title.height - 16
    }

    Text {
        id: error

        readonly property bool known: root.knowledge.avgReprojectionError !== undefined

        anchors.right: parent.right
        anchors.rightMargin: root.margin
        anchors.bottom: parent.bottom
        anchors.bottomMargin: root.margin
        visible: known && root.hovered && root.width >= 150 && root.height >= 110
        text: known ? qsTr("%1 px").arg(root.knowledge.avgReprojectionError.toFixed(2)) : ""
        color: known ? root.knowledge.avgReprojectionErrorColor : "#B4B8BE"
        style: Text.Outline
        styleColor: "#70000000"
        font.pixelSize: 12
    }
}
