import './style/base.css';
import './style/controls.css';
import './style/head.css';
import './style/workspace.css';
import './style/stage.css';
import './style/side.css';
import './style/timeline.css';
import './style/dialogs.css';
import './style/screens.css';
import { App } from './app';

new App().start();
