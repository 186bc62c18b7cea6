<?xml version="1.0" encoding="utf-8"?>
<!DOCTYPE TS>
<TS version="2.1" language="en">
<context>
    <name></name>
    <message>
        <source>themelet-la-sunset</source>
        <translation>Sunset</translation>
    </message>
    <message>
        <source>themelet-la-dusk</source>
        <translation>Dusk</translation>
    </message>
</context>
</TS>
