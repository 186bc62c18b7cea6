<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="en_GB">
<context>
    <name></name>
    <message>
        <source>tone-a</source>
        <translation>Engineering A</translation>
    </message>
    <message>
        <source>tone-b</source>
        <translation>Engineering B</translation>
    </message>
    <message>
        <source>tone-e</source>
        <translation>Engineering E</translation>
    </message>
</context>
</TS>
