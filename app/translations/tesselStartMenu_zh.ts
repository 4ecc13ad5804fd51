<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="zh_CN">
<context>
    <name>SMMenuWindowController</name>
    <message>
        <source>Menu Settings…</source>
        <translation>菜单设置…</translation>
    </message>
    <message>
        <source>Back</source>
        <translation>返回</translation>
    </message>
    <message>
        <source>All Programs</source>
        <translation>所有程序</translation>
    </message>
</context>
<context>
    <name>SMSearchField</name>
    <message>
        <source>Clear</source>
        <translation>清除</translation>
    </message>
</context>
<context>
    <name>SMStatusItemView</name>
    <message>
        <source>Start menu</source>
        <translation>开始菜单</translation>
    </message>
</context>
<context>
    <name>menuWindow</name>
    <message>
        <source>Start menu</source>
        <translation>开始菜单</translation>
    </message>
    <message>
        <source>Virtual machine</source>
        <translation>虚拟机</translation>
    </message>
    <message>
        <source>Search</source>
        <translation>搜索</translation>
    </message>
    <message>
        <source>Search applications</source>
        <translation>搜索应用程序</translation>
    </message>
    <message>
        <source>Places and commands</source>
        <translation>位置和命令</translation>
    </message>
    <message>
        <source>Applications</source>
        <translation>应用程序</translation>
    </message>
    <message>
        <source>Undo</source>
        <translation>撤销</translation>
    </message>
    <message>
        <source>Cut</source>
        <translation>剪切</translation>
    </message>
    <message>
        <source>Copy</source>
        <translation>复制</translation>
    </message>
    <message>
        <source>Paste</source>
        <translation>粘贴</translation>
    </message>
    <message>
        <source>Select All</source>
        <translation>全选</translation>
    </message>
    <message>
        <source>Menu Settings…</source>
        <translation>菜单设置…</translation>
    </message>
    <message>
        <source>Close</source>
        <translation>关闭</translation>
    </message>
    <message numerus="yes">
        <source>%n result(s)</source>
        <translation>
            <numerusform>%n 个结果</numerusform>
        </translation>
    </message>
</context>
</TS>
