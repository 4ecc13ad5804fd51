<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="ja">
<context>
    <name>SMMenuWindowController</name>
    <message>
        <source>Menu Settings…</source>
        <translation>メニュー設定…</translation>
    </message>
    <message>
        <source>Back</source>
        <translation>戻る</translation>
    </message>
    <message>
        <source>All Programs</source>
        <translation>すべてのプログラム</translation>
    </message>
</context>
<context>
    <name>SMSearchField</name>
    <message>
        <source>Clear</source>
        <translation>消去</translation>
    </message>
</context>
<context>
    <name>SMStatusItemView</name>
    <message>
        <source>Start menu</source>
        <translation>スタートメニュー</translation>
    </message>
</context>
<context>
    <name>menuWindow</name>
    <message>
        <source>Start menu</source>
        <translation>スタートメニュー</translation>
    </message>
    <message>
        <source>Virtual machine</source>
        <translation>仮想マシン</translation>
    </message>
    <message>
        <source>Search</source>
        <translation>検索</translation>
    </message>
    <message>
        <source>Search applications</source>
        <translation>アプリケーションを検索</translation>
    </message>
    <message>
        <source>Places and commands</source>
        <translation>場所とコマンド</translation>
    </message>
    <message>
        <source>Applications</source>
        <translation>アプリケーション</translation>
    </message>
    <message>
        <source>Undo</source>
        <translation>元に戻す</translation>
    </message>
    <message>
        <source>Cut</source>
        <translation>切り取り</translation>
    </message>
    <message>
        <source>Copy</source>
        <translation>コピー</translation>
    </message>
    <message>
        <source>Paste</source>
        <translation>貼り付け</translation>
    </message>
    <message>
        <source>Select All</source>
        <translation>すべて選択</translation>
    </message>
    <message>
        <source>Menu Settings…</source>
        <translation>メニュー設定…</translation>
    </message>
    <message>
        <source>Close</source>
        <translation>閉じる</translation>
    </message>
    <message numerus="yes">
        <source>%n result(s)</source>
        <translation>
            <numerusform>%n 件の結果</numerusform>
        </translation>
    </message>
</context>
</TS>
