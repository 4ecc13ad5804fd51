<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="ar">
<context>
    <name>tesselDaemon</name>
    <message>
        <source>Sound &amp; Video</source>
        <translation>الصوت والفيديو</translation>
    </message>
    <message>
        <source>Development</source>
        <translation>التطوير</translation>
    </message>
    <message>
        <source>Education</source>
        <translation>التعليم</translation>
    </message>
    <message>
        <source>Games</source>
        <translation>الألعاب</translation>
    </message>
    <message>
        <source>Graphics</source>
        <translation>الرسوميات</translation>
    </message>
    <message>
        <source>Internet</source>
        <translation>الإنترنت</translation>
    </message>
    <message>
        <source>Office</source>
        <translation>المكتب</translation>
    </message>
    <message>
        <source>Science</source>
        <translation>العلوم</translation>
    </message>
    <message>
        <source>Settings</source>
        <translation>الإعدادات</translation>
    </message>
    <message>
        <source>System Tools</source>
        <translation>أدوات النظام</translation>
    </message>
    <message>
        <source>Accessories</source>
        <translation>الملحقات</translation>
    </message>
    <message>
        <source>Other</source>
        <translation>أخرى</translation>
    </message>
    <message>
        <source>Home</source>
        <translation>المجلد الشخصي</translation>
    </message>
    <message>
        <source>Places</source>
        <translation>الأماكن</translation>
    </message>
    <message>
        <source>File System</source>
        <translation>نظام الملفات</translation>
    </message>
    <message>
        <source>This computer</source>
        <translation>هذا الحاسوب</translation>
    </message>
</context>
</TS>
